#include "memory/AdviceForms.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "Samples.h"

namespace assay_host {
namespace {

using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

Advice MakeAdvice()
{
    Advice advice;
    advice.fTime = kNow;
    advice.fName = "5a0a2f38-0000-5000-8000-000000000000";
    advice.fPlan = Plan::kTry;
    advice.fDue = Due::kFirst;
    advice.fTried = true;
    advice.fCount = 3;
    advice.fOpenGL.fOutlook.fFinding = MakeFinding(Usability::kHardware, "trials-passed");
    advice.fOpenGL.fOutlook.fTime = kNow - 2 * Policy::kDay;
    advice.fOpenGL.fOutlook.fNextTime = kNow + Policy::kDay;
    advice.fOpenGL.fOutlook.fWarning = "A warning.";
    advice.fOpenGL.fEnd = AttemptEnd::kEnded;
    advice.fOpenCL.fOutlook.fFinding = MakeFinding(Usability::kBroken, "crashed");
    advice.fOpenCL.fOutlook.fFinding.fTag = "clgpu[0]";
    advice.fOpenCL.fOutlook.fFinding.fDevice = "It's \x1B[31m\xFF";
    advice.fOpenCL.fOutlook.fTime = kNow - 61;
    advice.fOpenCL.fOutlook.fFailures = 2;
    advice.fOpenCL.fEnd = AttemptEnd::kCrashed;
    advice.fOpenCL.fEndReason = "A signal ended the child.";
    advice.fOpenCL.fLastLine = "# clFinish";
    advice.fOpenCL.fIsLast = true;
    advice.fMessages = {"A message."};
    return advice;
}

TEST(AdviceFormsTest, TellsPeopleWhatAndWhy)
{
    EXPECT_EQ(MakeAdviceText(MakeAdvice()), R"(OpenGL: hardware
  why      A sentence.
  device   glgpu[0], A card, driver 1.2
  since    2027-01-13T08:00:00Z (2 days ago)
  warning  A warning.
  change   The next attempt is due at 2027-01-16T08:00:00Z, or if a fresh one is requested.
OpenCL: broken
  why      A sentence.
  device   clgpu[0], It's \x1B[31m\xFF, driver 1.2
  end      A signal ended the child.
  line     # clFinish
  since    2027-01-15T07:58:59Z (1 minute ago)
  failures 2
  change   The next call makes an attempt.
Attempts: 3
Made: one attempt: nothing is known of this state of the machine
)");
}

TEST(AdviceFormsTest, QuotesForShells)
{
    const std::string text = MakeAdviceVariables(MakeAdvice());
    EXPECT_THAT(text, StartsWith("ASSAY_OPENGL='hardware'\n"));
    EXPECT_THAT(text, HasSubstr("\nASSAY_OPENCL_DEVICE='It'\\''s \\x1B[31m\\xFF'\n"));
    EXPECT_THAT(text, HasSubstr("\nASSAY_OPENCL_AGE='61'\n"));
    EXPECT_THAT(text, HasSubstr("\nASSAY_OPENGL_NEXT='2027-01-16T08:00:00Z'\n"));
    EXPECT_THAT(text, HasSubstr("\nASSAY_OPENCL_NEXT=''\n"));
    EXPECT_THAT(text, HasSubstr("\nASSAY_TRIED='1'\n"));
    EXPECT_THAT(text, Not(HasSubstr("\x1B")));
}

TEST(AdviceFormsTest, WritesADocument)
{
    const auto document = nlohmann::json::parse(MakeAdviceDocument(MakeAdvice(), "1.2.3", 21));
    EXPECT_EQ(document["schema"], 1);
    EXPECT_EQ(document["version"], "1.2.3");
    EXPECT_EQ(document["status"], 21);
    EXPECT_EQ(document["opengl"]["source"], "memory");
    EXPECT_EQ(document["opengl"]["lastLine"], nullptr);
    EXPECT_EQ(document["opencl"]["source"], "attempt");
    EXPECT_EQ(document["opencl"]["end"], "crashed");
    EXPECT_EQ(document["opencl"]["age"], 61);
    EXPECT_EQ(document["opencl"]["nextAttempt"], nullptr);
    EXPECT_EQ(document["opencl"]["device"]["name"], "It's \x1B[31m\xEF\x9F\xBF");
    EXPECT_EQ(document["messages"], nlohmann::json({"A message."}));
}

TEST(AdviceFormsTest, WritesAllMembersOfADocument)
{
    Advice advice = MakeAdvice();
    advice.fOpenCL = {};
    EXPECT_EQ(nlohmann::json::parse(MakeAdviceDocument(advice, "1.2.3", 0)),
              nlohmann::json::parse(R"({
        "schema": 1, "version": "1.2.3", "time": "2027-01-15T08:00:00Z", "status": 0,
        "identity": "5a0a2f38-0000-5000-8000-000000000000", "plan": "try", "due": "first",
        "tried": true, "attempts": 3,
        "opengl": {"answer": "hardware", "reason": "trials-passed", "text": "A sentence.",
            "source": "memory", "learnt": "hardware",
            "device": {"tag": "glgpu[0]", "name": "A card", "driver": "1.2"},
            "end": "ended", "endReason": null, "lastLine": null, "time": "2027-01-13T08:00:00Z",
            "age": 172800, "failures": 0, "nextAttempt": "2027-01-16T08:00:00Z",
            "warning": "A warning.", "change": "The next attempt is due at 2027-01-16T08:00:00Z, )"
                                    R"(or if a fresh one is requested."},
        "opencl": {"answer": "unknown", "reason": "", "text": "", "source": "none",
            "learnt": "unknown", "device": null, "end": null, "endReason": null, "lastLine": null,
            "time": null, "age": null, "failures": 0, "nextAttempt": null, "warning": null,
            "change": "The next call makes an attempt."},
        "messages": ["A message."]})"));
}

TEST(AdviceFormsTest, NamesOnlyWhatIsKnownOfADevice)
{
    Advice advice = MakeAdvice();
    Finding& finding = advice.fOpenGL.fOutlook.fFinding;
    finding.fDevice.clear();
    EXPECT_THAT(MakeAdviceText(advice), HasSubstr("  device   glgpu[0], driver 1.2\n"));
    finding.fDriver.clear();
    EXPECT_THAT(MakeAdviceText(advice), HasSubstr("  device   glgpu[0]\n"));
    finding.fTag.clear();
    EXPECT_THAT(MakeAdviceText(advice), Not(HasSubstr("  device   \n")));
    finding.fDevice = "A card";
    EXPECT_THAT(MakeAdviceText(advice), HasSubstr("  device   A card\n"));
}

TEST(AdviceFormsTest, TellsAnAgeInItsLargestUnit)
{
    const std::pair<std::int64_t, const char*> kRows[] = {{0, "now"},
                                                          {1, "1 second ago"},
                                                          {59, "59 seconds ago"},
                                                          {60, "1 minute ago"},
                                                          {3599, "59 minutes ago"},
                                                          {3600, "1 hour ago"},
                                                          {86399, "23 hours ago"},
                                                          {86400, "1 day ago"},
                                                          {3 * 86400 - 1, "2 days ago"}};
    Advice advice = MakeAdvice();
    for (const auto& [age, text] : kRows) {
        advice.fOpenGL.fOutlook.fTime = kNow - age;
        EXPECT_THAT(MakeAdviceText(advice), HasSubstr("Z (" + std::string(text) + ")\n"));
    }
}

TEST(AdviceFormsTest, HasTheStatusOfWhatIsNeeded)
{
    Advice advice = MakeAdvice(); // OpenGL works, OpenCL is broken
    AdviceRequest request;
    EXPECT_EQ(GetAdviceStatus(request, advice), 0);
    request.fNeedsOpenCL = true;
    EXPECT_EQ(GetAdviceStatus(request, advice), 21);
    request.fNeedsOpenGL = false;
    EXPECT_EQ(GetAdviceStatus(request, advice), 21);
    advice.fOpenCL.fChosen = {Usability::kHardware, kNow};
    EXPECT_EQ(GetAdviceStatus(request, advice), 0);
    advice.fStopped = true;
    EXPECT_EQ(GetAdviceStatus(request, advice), 6);
}

TEST(AdviceFormsTest, TellsTheUsersChoiceApart)
{
    Advice advice = MakeAdvice();
    advice.fOpenGL.fChosen = {Usability::kSoftware, kNow + 5};
    const std::string text = MakeAdviceText(advice);
    EXPECT_THAT(text, StartsWith("OpenGL: software\n  why      The user chose this for OpenGL.\n"
                                 "  learnt   hardware: A sentence.\n"));
    EXPECT_THAT(text, HasSubstr("(now)"));
    EXPECT_THAT(text, HasSubstr("\"assay-host state set opengl=auto\" takes the choice back."));
    EXPECT_STREQ(GetSourceName(advice, DeviceKind::kOpenGL), "choice");
    const auto document = nlohmann::json::parse(MakeAdviceDocument(advice, "", 20));
    EXPECT_EQ(document["opengl"]["answer"], "software");
    EXPECT_EQ(document["opengl"]["reason"], "chosen");
    EXPECT_EQ(document["opengl"]["learnt"], "hardware");
    EXPECT_EQ(document["opengl"]["age"], 0);
}

TEST(AdviceFormsTest, TellsWhatWouldChangeTheAnswer)
{
    Advice advice = MakeAdvice();
    Finding& finding = advice.fOpenGL.fOutlook.fFinding;
    const auto change = [&] { return GetChangeText(advice, DeviceKind::kOpenGL); };
    EXPECT_EQ(change(),
              "The next attempt is due at 2027-01-16T08:00:00Z, or if a fresh one is requested.");
    finding = MakeFinding(Usability::kBroken);
    EXPECT_EQ(change(), "The next attempt is due at 2027-01-16T08:00:00Z, or after a change of a "
                        "driver or of the system, or after \"assay-host state forget\".");
    finding = MakeFinding(Usability::kAbsent);
    EXPECT_EQ(change(), "The next attempt is due at 2027-01-16T08:00:00Z, or after the "
                        "installation of a driver.");
    finding = MakeFinding(Usability::kUnknown, "other-instance");
    EXPECT_EQ(change(), "Call again, or wait longer.");
    finding = MakeFinding(Usability::kUnknown, "host-ended");
    EXPECT_EQ(change(),
              "The next attempt is due at 2027-01-16T08:00:00Z, or after \"assay-host state "
              "forget\".");
    advice.fOpenGL.fOutlook.fNextTime.reset();
    EXPECT_EQ(change(), "The next call makes an attempt.");
    finding = MakeFinding(Usability::kUnknown, "never-started");
    EXPECT_EQ(change(), "Check the installation of assay. The next call makes an attempt.");
}

TEST(AdviceFormsTest, SaysWhyAnAttemptIsDue)
{
    Advice advice;
    advice.fPlan = Plan::kTry;
    const std::pair<Due, const char*> rows[] = {
        {Due::kFirst, "one attempt: nothing is known of this state of the machine"},
        {Due::kOld, "one attempt: what is known is too old"},
        {Due::kRequested, "one attempt: a fresh one is requested"},
        {Due::kAfterFailure, "one attempt: the pause after the last failure is over"},
        {Due::kForgiven, "one attempt: the last failures are too old to count"},
        {Due::kAfterFreeze, "one attempt: the system ended during the last one"},
        {Due::kUnclear, "one attempt: the last one showed nothing"},
        {Due::kNot, "one attempt"}};
    for (const auto& [due, text] : rows) {
        advice.fDue = due;
        EXPECT_THAT(MakeAdviceText(advice), testing::EndsWith(std::string("Plan: ") + text + "\n"));
    }
}

TEST(AdviceFormsTest, NamesAttemptsThatSaidNothing)
{
    Advice advice;
    EXPECT_STREQ(GetSourceName(advice, DeviceKind::kOpenGL), "none");
    EXPECT_EQ(nlohmann::json::parse(MakeAdviceDocument(advice, "", 23))["opengl"]["end"], nullptr);
    EXPECT_THAT(MakeAdviceText(advice), HasSubstr("\nPlan: no attempt: memory has the answer\n"));
    advice.fPlan = Plan::kWait;
    EXPECT_THAT(MakeAdviceText(advice), HasSubstr("\nPlan: another process makes an attempt\n"));
}

} // namespace
} // namespace assay_host
