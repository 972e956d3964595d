#include "bugreport/BugReport.h"

#include <algorithm>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Lines.h"
#include "Samples.h"

namespace assay_host {
namespace {

using testing::HasSubstr;
using testing::Not;

constexpr char kSecret[] = "alice on BOX in /home/alice";

BugReportData MakeData()
{
    BugReportData data;
    data.fReport = ReadReport(Sample(1, 1).GetText());
    data.fOutcome.fVerdict = Verdict::kComplete;
    data.fOutcome.fCommand = {"assay"};
    data.fOutcome.fReason = "All tests ran.";
    data.fOutcome.fDrivers = {
        {{DeviceKind::kOpenGL, "/lib/libEGL.so", {"1.1.0", {}}, {{}, "none"}}}, {}};
    data.fFacts.fHostVersion = "1.0.0";
    data.fFacts.fEnvironment.fTime = "2026-11-22T14:25:26Z";
    data.fLog = {"Tester=\"Pixmere\"",
                 "# 00001.2026.11.22_14:25:26.000(+00.000)[tid=1] wmiNumDevices=1"};
    data.fIdentity.fAdapters = {{"0000:01:00.0", 0x10DE, 0x2684, "nvidia", "550.1"}};
    data.fIdentity.fFiles = {{DeviceKind::kOpenCL, "/etc/OpenCL/vendors/a.icd", 7, 0, ""}};
    data.fKernel.fLines = {"[    1.000000] [drm] x"};
    return data;
}

const Mask& GetMask()
{
    static const Mask mask({{"alice", "USER"}, {"BOX", "HOST"}, {"/home/alice", "HOME"}});
    return mask;
}

std::string GetText(const std::vector<BugReportFile>& files, const std::string& name)
{
    const auto found = std::find_if(files.begin(), files.end(), [&name](const BugReportFile& file) {
        return file.fName == name;
    });
    return found == files.end() ? "no such file" : found->fText;
}

TEST(BugReport, HasTheFilesOfTheList)
{
    const std::vector<BugReportFile> files = MakeBugReport(MakeData(), GetMask());
    ASSERT_EQ(files.size(), ListBugReport().size());
    for (std::size_t file = 0; file < files.size(); ++file) {
        EXPECT_EQ(files[file].fName, ListBugReport()[file].fName);
        EXPECT_EQ(files[file].fWhat, ListBugReport()[file].fWhat);
        EXPECT_EQ(files[file].fReason, "");
        EXPECT_NE(files[file].fText, "");
        EXPECT_THAT(files[0].fText, HasSubstr("\n" + (file > 0 ? files[file].fName : "")));
    }
    EXPECT_THAT(files[0].fText, HasSubstr("\nMissing:\nnothing\n"));
    EXPECT_THAT(GetText(files, "summary.txt"), HasSubstr("Run: all tests ran"));
    EXPECT_THAT(GetText(files, "report.txt"), HasSubstr("Tester=\"Pixmere\"\n# 00001"));
    EXPECT_THAT(GetText(files, "report.json"), HasSubstr("\"schema\""));
    EXPECT_THAT(GetText(files, "system.txt"), HasSubstr("assay-host    1.0.0\n"));
    EXPECT_THAT(GetText(files, "adapters.txt"),
                HasSubstr("0000:01:00.0 vendor 0x10DE device 0x2684 driver nvidia 550.1\n"));
    EXPECT_THAT(GetText(files, "adapters.txt"), HasSubstr("wmiNumDevices=1\n"));
    EXPECT_THAT(GetText(files, "adapters.txt"), Not(HasSubstr("Tester")));
    EXPECT_THAT(GetText(files, "drivers.txt"), HasSubstr("OpenGL /lib/libEGL.so\n  version 1.1.0"));
    EXPECT_THAT(GetText(files, "drivers.txt"), HasSubstr("OpenCL /etc/OpenCL/vendors/a.icd\n"));
    EXPECT_EQ(GetText(files, "kernel.txt"), "[    1.000000] [drm] x\n");
}

TEST(BugReport, NamesWhatIsMissingWithItsReason)
{
    BugReportData data = MakeData();
    data.fKernel = {{}, "/dev/kmsg: Operation not permitted; journalctl is not installed"};
    data.fOutcome.fDrivers = {{}, "the child was not started"};
    data.fLog.clear();
    const std::vector<BugReportFile> files = MakeBugReport(data, GetMask());
    EXPECT_THAT(files[0].fText,
                HasSubstr("\nkernel.txt    /dev/kmsg: Operation not permitted; journalctl is not "
                          "installed\n"));
    EXPECT_THAT(files[0].fText, HasSubstr("\ndrivers.txt   the child was not started\n"));
    EXPECT_THAT(files[0].fText, HasSubstr("\nreport.txt    assay printed nothing\n"));
    EXPECT_EQ(GetText(files, "kernel.txt"), "not known (" + data.fKernel.fReason + ")\n");
}

// A secret in each text that can have one.
BugReportData MakePrivateData()
{
    BugReportData data = MakeData();
    data.fReport = ReadReport(Sample(1, 1)
                                  .Set("glgpu[0].GLRenderer", std::string("\"") + kSecret + "\"")
                                  .Set("clgpu[0].CLName", std::string("\"\n") + kSecret + "\"")
                                  .GetText() +
                              "# " + kSecret + "\nraw " + kSecret + "\n");
    RunOutcome& outcome = data.fOutcome;
    outcome.fVerdict = Verdict::kCrashed;
    for (std::string* const text :
         {&outcome.fTermination, &outcome.fReason, &outcome.fLastReportLine, &outcome.fLastLogLine})
        *text = kSecret;
    outcome.fCommand = {"/home/alice/assay", kSecret};
    outcome.fErrorLines = {kSecret};
    outcome.fCauses = {{"OGLContextCreated", kSecret}};
    outcome.fDrivers = {{{DeviceKind::kOpenGL, "/home/alice/x.so", {kSecret, {}}, {{}, kSecret}}},
                        {}};
    data.fFacts.fChildVersion = {kSecret, {}};
    Environment& environment = data.fFacts.fEnvironment;
    for (Fact* const fact : {&environment.fSystem, &environment.fBuild, &environment.fKernel,
                             &environment.fArchitecture, &environment.fHost})
        *fact = {kSecret, {}};
    data.fLog = {kSecret};
    data.fIdentity.fAdapters = {{kSecret, 0, 0, kSecret, kSecret}};
    data.fIdentity.fFiles = {{DeviceKind::kOpenGL, kSecret, 0, 0, ""}};
    data.fIdentity.fVariables = {std::string("X=") + kSecret};
    data.fKernel.fLines = {kSecret};
    return data;
}

std::size_t CountNames(const std::vector<BugReportFile>& files)
{
    std::size_t count = 0;
    for (const BugReportFile& file : files)
        for (const char* const name : {"alice", "BOX"})
            for (std::size_t at = file.fText.find(name); at != std::string::npos;
                 at = file.fText.find(name, at + 1))
                ++count;
    return count;
}

TEST(BugReport, HidesSecretsInAllTexts)
{
    EXPECT_EQ(CountNames(MakeBugReport(MakePrivateData(), GetMask())), 0U);
    // They are there without the mask.
    EXPECT_GT(CountNames(MakeBugReport(MakePrivateData(), Mask({}))), 50U);
    const std::vector<BugReportFile> files = MakeBugReport(MakePrivateData(), GetMask());
    EXPECT_THAT(GetText(files, "report.json"), HasSubstr("\"USER on HOST in HOME\""));
    EXPECT_THAT(GetText(files, "report.json"), HasSubstr("\"HOME/assay\""));
}

TEST(BugReport, HidesSecretsInReasons)
{
    BugReportData data = MakeData();
    data.fKernel = {{}, kSecret};
    data.fOutcome.fDrivers = {{}, kSecret};
    EXPECT_EQ(CountNames(MakeBugReport(data, GetMask())), 0U);
}

} // namespace
} // namespace assay_host
