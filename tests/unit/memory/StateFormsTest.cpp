#include "memory/StateForms.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Samples.h"

namespace assay_host {
namespace {

const std::string kName = "5a0a2f38-0000-5000-8000-000000000000";

TEST(StateFormsTest, ListsEntriesAndTheChoice)
{
    Choice choice;
    choice.fOpenCL = {Usability::kAbsent, kNow};
    EXPECT_EQ(MakeStateList({{kName, kNow, MakeKnowledge(), ""},
                             {"6" + kName.substr(1), kNow, std::nullopt, "it is damaged"}},
                            choice, kNow),
              R"(entry     changed               attempts  OpenGL    OpenCL    adapters
5a0a2f38  2027-01-15T08:00:00Z  2         hardware  software  0000:01:00.0 10de:2484 nvidia 535.1, 0000:02:00.0 1002:73bf amdgpu
6a0a2f38  2027-01-15T08:00:00Z  ignored: it is damaged
choice: opencl=absent since 2027-01-15T08:00:00Z
)");
}

TEST(StateFormsTest, ShowsAllOfAnEntry)
{
    Knowledge knowledge = MakeKnowledge();
    Attempt open;
    open.fStarted = kNow;
    open.fHost = {7, 1007, "boot-1", "machine"};
    AddAttempt(knowledge, open);
    EXPECT_EQ(MakeStateText({kName, kNow, knowledge, ""}),
              R"(entry 5a0a2f38-0000-5000-8000-000000000000
  system Linux 6.1.0-13
  assay 1.0.0
  adapter 0000:01:00.0 10de:2484 nvidia 535.1
  adapter 0000:02:00.0 1002:73bf amdgpu
  variable DRI_PRIME=1
  OpenGL file /usr/lib/libEGL.so.1.1.0, 77000 bytes, 2023-11-14T22:13:20Z, build ab12
  OpenCL file /usr/lib/libOpenCL.so.1.0.0, 1152921504606846976 bytes, 1970-01-01T00:00:00Z
  attempts: 3, the last 3:
  2027-01-15T07:58:20Z crashed
    How it ended.
    last line: # \xFF\x80 clFinish
    OpenGL: hardware, A sentence.
    OpenCL: broken, A sentence.
  2027-01-15T07:59:50Z ended
    How it ended.
    last line: The last line.
    OpenGL: hardware, A sentence.
    OpenCL: software, A sentence.
  2027-01-15T08:00:00Z open
    process 7 of boot boot-1
)");
    EXPECT_EQ(MakeStateText({kName, kNow, std::nullopt, "it is a link"}),
              "entry " + kName + "\n  ignored: it is a link\n");
}

} // namespace
} // namespace assay_host
