#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Lines.h"
#include "Samples.h"
#include "report/NextSteps.h"

namespace assay_host {
namespace {

constexpr char kUpdate[] = "Update the graphics driver, or reinstall it.";
constexpr char kReport[] = "If the newest driver fails too, report it to the driver's developers, "
                           "with the archive of assay-host bugreport.";

std::vector<std::string> Get(const std::string& text, Verdict verdict)
{
    RunOutcome outcome;
    outcome.fVerdict = verdict;
    const Report report = ReadReport(text);
    return GetNextSteps(GetAnswers(report), outcome);
}

using Steps = std::vector<std::string>;

TEST(NextSteps, NoneForAGoodMachine)
{
    EXPECT_EQ(Get(Sample(1, 1).GetText(), Verdict::kComplete), Steps());
    // OpenCL is often left out on purpose.
    EXPECT_EQ(Get(Sample(1, -1).GetText(), Verdict::kComplete), Steps());
}

TEST(NextSteps, AreNotRepeated)
{
    const std::string text = Sample(1, 1)
                                 .Set("glgpu[0].GLFrameBufferOK", "0")
                                 .Fail("clgpu[0]", "CLDeviceVersion")
                                 .GetText();
    EXPECT_EQ(Get(text, Verdict::kFailedTests), (Steps{kUpdate, kReport}));
}

TEST(NextSteps, OfEachVerdict)
{
    const std::string broken = Sample(1, 1).EndAfter("glgpu[0].GLVersion").GetText();
    EXPECT_EQ(Get(broken, Verdict::kCrashed), (Steps{kUpdate, kReport}));
    EXPECT_EQ(Get(broken, Verdict::kHung),
              (Steps{"If the machine is slow or busy, run again with a longer --timeout.", kUpdate,
                     kReport}));
    EXPECT_EQ(Get("", Verdict::kNeverStarted),
              (Steps{"Check that assay is installed beside assay-host or on the PATH, or name it "
                     "with --assay."}));
    EXPECT_EQ(Get("", Verdict::kUsageError),
              (Steps{"Correct assay's options, those after \"--\"; assay -help lists them."}));
    EXPECT_EQ(Get("", Verdict::kInterrupted), (Steps{"Run again, and let the run end by itself."}));
}

TEST(NextSteps, OfARunThatFailsAfterTheTrials)
{
    const std::string usable = Sample(1, 1).GetText();
    EXPECT_EQ(Get(usable, Verdict::kFailedTests), Steps{kReport});
    EXPECT_EQ(Get(usable, Verdict::kCrashed), Steps{kReport});
}

TEST(NextSteps, ForNoLibrary)
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kComplete;
    outcome.fCauses = {{"QGFOGLInitialized", "libEGL.so.1 can't be opened (x)"}};
    const Report report = ReadReport(Sample(0, -1).Set("QGFOGLInitialized", "0").GetText());
    EXPECT_EQ(GetNextSteps(GetAnswers(report), outcome),
              (Steps{"Install an OpenGL library and the graphics card's driver."}));
}

TEST(NextSteps, ForSoftwareAndForNoDevice)
{
    EXPECT_EQ(
        Get(Sample(1, -1).Set("glgpu[0].GLRenderer", "\"llvmpipe\"").GetText(), Verdict::kComplete),
        (Steps{"If the machine has a graphics card, install its OpenGL driver, and check that "
               "this user may open the card."}));
    EXPECT_EQ(Get(Sample(0, -1).GetText(), Verdict::kComplete),
              (Steps{"Install the graphics card's driver, and check that this user may open the "
                     "card."}));
}

} // namespace
} // namespace assay_host
