#include "memory/Policy.h"

#include <gtest/gtest.h>

#include <ostream>

#include <fmt/format.h>

#include "Samples.h"

namespace assay_host {
namespace {

constexpr std::int64_t kMinute = Policy::kMinute;
constexpr std::int64_t kHour = Policy::kHour;
constexpr std::int64_t kDay = Policy::kDay;
constexpr std::int64_t kYear = 365 * kDay;

constexpr AttemptEnd kEnded = AttemptEnd::kEnded;
constexpr AttemptEnd kCrashed = AttemptEnd::kCrashed;
constexpr AttemptEnd kHung = AttemptEnd::kHung;
constexpr AttemptEnd kKilled = AttemptEnd::kKilled;
constexpr AttemptEnd kNotStarted = AttemptEnd::kNotStarted;
constexpr AttemptEnd kStopped = AttemptEnd::kStopped;
constexpr AttemptEnd kHostEnded = AttemptEnd::kHostEnded;
constexpr AttemptEnd kSystemEnded = AttemptEnd::kSystemEnded;

Usability ReadLetter(char letter)
{
    switch (letter) {
    case 'H':
        return Usability::kHardware;
    case 'S':
        return Usability::kSoftware;
    case 'B':
        return Usability::kBroken;
    case 'A':
        return Usability::kAbsent;
    default:
        return Usability::kUnknown;
    }
}

// An attempt that ended this long ago. The letters are those of OpenGL's and OpenCL's answers; '-'
// is an unknown one, '<' one of an interface that the child ended before.
Attempt Made(std::int64_t ago, AttemptEnd end, const char* letters)
{
    Attempt attempt = MakeAttempt(kNow - ago, end, ReadLetter(letters[0]), ReadLetter(letters[1]));
    for (const auto& [letter, finding] :
         {std::pair(letters[0], &attempt.fOpenGL), std::pair(letters[1], &attempt.fOpenCL)})
        if (letter == '<')
            finding->fReason = "ended-before";
    return attempt;
}

std::string Show(const Outlook& outlook)
{
    std::string text = std::string(GetUsabilityName(outlook.fFinding.fUsability)) + " " +
                       outlook.fFinding.fReason + ", ";
    if (outlook.fDue != Due::kNot)
        text += GetDueName(outlook.fDue);
    else
        text += fmt::format("in {}", *outlook.fNextTime - kNow);
    EXPECT_EQ(outlook.fNextTime.has_value(), outlook.fDue == Due::kNot);
    EXPECT_EQ(outlook.fBasis == nullptr, outlook.fFinding.fReason == "not-tried");
    EXPECT_FALSE(outlook.fFinding.fText.empty());
    if (outlook.fFailures > 0)
        text += fmt::format(", {} failed", outlook.fFailures);
    return text + (outlook.fWarning.empty() ? "" : ", warning");
}

struct Row {
    const char* fName;
    std::vector<Attempt> fAttempts;
    std::string fGL;
    std::string fCL;
    bool fFresh = false;
};

const std::string kFirst = "unknown not-tried, first";
const std::string kGood = fmt::format("hardware a-reason, in {}", 30 * kDay - 99);

const std::vector<Row> kRows = {
    {"nothing", {}, kFirst, kFirst},
    {"good", {Made(100, kEnded, "HH")}, kGood, kGood},
    {"good by a run with failed tests after",
     {Made(100, kCrashed, "HB")},
     kGood,
     "broken a-reason, after-failure, 1 failed"},
    {"software",
     {Made(100, kEnded, "SS")},
     fmt::format("software a-reason, in {}", 30 * kDay - 99),
     fmt::format("software a-reason, in {}", 30 * kDay - 99)},
    {"good until it is old",
     {Made(30 * kDay, kEnded, "HS")},
     "hardware a-reason, in 1",
     "software a-reason, in 1"},
    {"too old",
     {Made(30 * kDay + 1, kEnded, "HS")},
     "unknown too-old, old",
     "unknown too-old, old"},
    {"fresh wanted",
     {Made(100, kEnded, "HA")},
     "hardware a-reason, requested",
     "absent a-reason, requested",
     true},
    {"absent is kept shortly",
     {Made(10 * kMinute, kEnded, "AH")},
     "absent a-reason, in 1",
     fmt::format("hardware a-reason, in {}", 30 * kDay + 1 - 10 * kMinute)},
    {"absent is too old soon",
     {Made(10 * kMinute + 1, kEnded, "AA")},
     "unknown too-old, old",
     "unknown too-old, old"},
    {"unknown is kept for a moment",
     {Made(kMinute, kEnded, "--")},
     "unknown a-reason, in 1",
     "unknown a-reason, in 1"},
    {"unknown is tried again",
     {Made(kMinute + 1, kEnded, "-H")},
     "unknown a-reason, unclear",
     fmt::format("hardware a-reason, in {}", 30 * kDay - kMinute)},

    // Failures, their pauses, their number and their end.
    {"one failure, in its pause",
     {Made(59, kCrashed, "B<")},
     "broken a-reason, in 1, 1 failed",
     "unknown ended-before, in 1, 1 failed"},
    {"one failure, after its pause",
     {Made(60, kHung, "B<")},
     "broken a-reason, after-failure, 1 failed",
     "unknown ended-before, after-failure, 1 failed"},
    {"fresh doesn't shorten a pause",
     {Made(59, kCrashed, "BB")},
     "broken a-reason, in 1, 1 failed",
     "broken a-reason, in 1, 1 failed",
     true},
    {"a trial that failed is a failure",
     {Made(59, kEnded, "BH")},
     "broken a-reason, in 1, 1 failed",
     fmt::format("hardware a-reason, in {}", 30 * kDay - 58)},
    {"two failures, in the longer pause",
     {Made(kDay, kCrashed, "B<"), Made(kHour - 1, kCrashed, "B<")},
     "broken a-reason, in 1, 2 failed",
     "unknown ended-before, in 1, 2 failed"},
    {"two failures, after it",
     {Made(kDay, kCrashed, "B<"), Made(kHour, kEnded, "B<")},
     "broken a-reason, after-failure, 2 failed",
     "unknown ended-before, after-failure, 2 failed"},
    {"three failures",
     {Made(2 * kDay, kCrashed, "B<"), Made(kDay, kHung, "B<"), Made(kHour, kCrashed, "B<")},
     fmt::format("broken a-reason, in {}, 3 failed", 7 * kDay + 1 - kHour),
     fmt::format("unknown ended-before, in {}, 3 failed", 7 * kDay + 1 - kHour)},
    {"three failures, two of them forgiven",
     {Made(9 * kDay, kCrashed, "BB"), Made(8 * kDay, kCrashed, "BB"), Made(kDay, kCrashed, "BB")},
     "broken a-reason, after-failure, 1 failed",
     "broken a-reason, after-failure, 1 failed"},
    {"forgiven",
     {Made(9 * kDay, kCrashed, "BB"), Made(8 * kDay, kHung, "BB"),
      Made(7 * kDay + 1, kEnded, "BB")},
     "unknown not-tried, forgiven",
     "unknown not-tried, forgiven"},
    {"a success ends the count",
     {Made(3000, kCrashed, "BB"), Made(2000, kCrashed, "BB"), Made(100, kEnded, "HS")},
     kGood + ", warning",
     fmt::format("software a-reason, in {}, warning", 30 * kDay - 99)},
    {"the warning ends with the failures' time",
     {Made(7 * kDay + 1, kCrashed, "BB"), Made(100, kEnded, "HH")},
     kGood,
     kGood},
    {"a failure after a success",
     {Made(5000, kEnded, "HH"), Made(59, kCrashed, "BH")},
     "broken a-reason, in 1, 1 failed",
     fmt::format("hardware a-reason, in {}", 30 * kDay - 58)},
    {"OpenCL broken for good doesn't block OpenGL",
     {Made(3000, kCrashed, "HB"), Made(2000, kHung, "HB"), Made(100, kCrashed, "HB")},
     kGood,
     fmt::format("broken a-reason, in {}, 3 failed", 7 * kDay - 99)},
    {"a failure in OpenGL leaves what is known of OpenCL",
     {Made(5000, kEnded, "HH"), Made(59, kCrashed, "B<")},
     "broken a-reason, in 1, 1 failed",
     "hardware a-reason, in 1, 1 failed, warning"},
    {"a failure before both leaves nothing",
     {Made(5000, kEnded, "HH"), Made(59, kCrashed, "<<")},
     "unknown ended-before, in 1, 1 failed",
     "unknown ended-before, in 1, 1 failed"},
    {"but not for longer than else",
     {Made(30 * kDay + 1, kEnded, "HH"), Made(59, kCrashed, "B<")},
     "broken a-reason, in 1, 1 failed",
     "unknown ended-before, in 1, 1 failed"},

    // What says nothing about a driver.
    {"could not be started",
     {Made(1, kNotStarted, "--")},
     "unknown a-reason, unclear",
     "unknown a-reason, unclear"},
    {"stopped",
     {Made(1, kStopped, "--")},
     "unknown a-reason, unclear",
     "unknown a-reason, unclear"},
    {"stopped after OpenGL was tried",
     {Made(100, kStopped, "H-")},
     kGood,
     "unknown a-reason, unclear"},
    {"could not be started after a success",
     {Made(100, kEnded, "HH"), Made(1, kNotStarted, "--")},
     kGood + ", warning",
     kGood + ", warning"},
    {"could not be started after an old success",
     {Made(31 * kDay, kEnded, "HH"), Made(1, kNotStarted, "--")},
     "unknown a-reason, old",
     "unknown a-reason, old"},
    {"could not be started after a failure",
     {Made(59, kCrashed, "BB"), Made(1, kNotStarted, "--")},
     "broken a-reason, in 1, 1 failed",
     "broken a-reason, in 1, 1 failed"},
    {"could not be started after a forgiven failure",
     {Made(8 * kDay, kCrashed, "BB"), Made(1, kStopped, "--")},
     "unknown a-reason, forgiven",
     "unknown a-reason, forgiven"},

    // Weak evidence.
    {"the host ended",
     {Made(1, kHostEnded, "--")},
     "unknown host-ended, unclear",
     "unknown host-ended, unclear"},
    {"the child was killed",
     {Made(1, kKilled, "H-")},
     fmt::format("hardware a-reason, in {}", 30 * kDay),
     "unknown killed, unclear"},
    {"the host ended after a success",
     {Made(100, kEnded, "HH"), Made(1, kHostEnded, "--")},
     "unknown host-ended, unclear",
     "unknown host-ended, unclear"},
    {"the host ended three times",
     {Made(3000, kHostEnded, "--"), Made(2000, kKilled, "--"), Made(599, kHostEnded, "--")},
     "unknown host-ended, in 1",
     "unknown host-ended, in 1"},
    {"the host ended three times, after the pause",
     {Made(3000, kHostEnded, "--"), Made(2000, kKilled, "--"), Made(600, kHostEnded, "--")},
     "unknown host-ended, unclear",
     "unknown host-ended, unclear"},
    {"the host ended long ago", {Made(8 * kDay, kHostEnded, "--")}, kFirst, kFirst},
    {"the host ended during the pause after a failure",
     {Made(59, kCrashed, "BB"), Made(1, kHostEnded, "--")},
     "broken a-reason, in 1, 1 failed",
     "broken a-reason, in 1, 1 failed"},

    // The end of the system.
    {"one freeze",
     {Made(1, kSystemEnded, "--")},
     "unknown system-ended, after-system-end, 1 failed",
     "unknown system-ended, after-system-end, 1 failed"},
    {"one freeze after a success",
     {Made(100, kEnded, "HH"), Made(1, kSystemEnded, "--")},
     "unknown system-ended, after-system-end, 1 failed",
     "unknown system-ended, after-system-end, 1 failed"},
    {"two freezes",
     {Made(100, kSystemEnded, "--"), Made(10, kSystemEnded, "--")},
     fmt::format("broken system-ended, in {}, 2 failed", 30 * kDay - 9),
     fmt::format("broken system-ended, in {}, 2 failed", 30 * kDay - 9)},
    {"two freezes with others between",
     {Made(100, kSystemEnded, "--"), Made(50, kNotStarted, "--"), Made(10, kSystemEnded, "--")},
     fmt::format("broken system-ended, in {}, 2 failed", 30 * kDay - 9),
     fmt::format("broken system-ended, in {}, 2 failed", 30 * kDay - 9)},
    {"a freeze, then a crash",
     {Made(kDay, kSystemEnded, "--"), Made(kHour - 1, kCrashed, "B<")},
     "broken a-reason, in 1, 2 failed",
     "unknown ended-before, in 1, 2 failed"},
    {"a freeze, then a success",
     {Made(200, kSystemEnded, "--"), Made(100, kEnded, "HH")},
     kGood + ", warning",
     kGood + ", warning"},
    {"a success after another", {Made(200, kEnded, "HH"), Made(100, kEnded, "HH")}, kGood, kGood},
    {"a freeze, at the end of its time, then a success",
     {Made(30 * kDay, kSystemEnded, "--"), Made(100, kEnded, "HH")},
     kGood + ", warning",
     kGood + ", warning"},
    {"a freeze, forgiven, then a success",
     {Made(30 * kDay + 1, kSystemEnded, "--"), Made(100, kEnded, "HH")},
     kGood,
     kGood},
    {"two freezes, at the end of their time",
     {Made(30 * kDay, kSystemEnded, "--"), Made(30 * kDay, kSystemEnded, "--")},
     "broken system-ended, in 1, 2 failed",
     "broken system-ended, in 1, 2 failed"},
    {"two freezes, forgiven",
     {Made(31 * kDay, kSystemEnded, "--"), Made(30 * kDay + 1, kSystemEnded, "--")},
     "unknown not-tried, forgiven",
     "unknown not-tried, forgiven"},

    // A clock that was set.
    {"a good result of the near future",
     {Made(-5 * kMinute, kEnded, "HH")},
     fmt::format("hardware a-reason, in {}", 30 * kDay + 5 * kMinute + 1),
     fmt::format("hardware a-reason, in {}", 30 * kDay + 5 * kMinute + 1)},
    {"a good result of the future",
     {Made(-5 * kMinute - 1, kEnded, "HA")},
     "unknown too-old, old",
     "unknown too-old, old"},
    {"a good result, years on",
     {Made(9 * kYear, kEnded, "HH")},
     "unknown too-old, old",
     "unknown too-old, old"},
    {"failures of the future",
     {Made(-kYear, kCrashed, "BB"), Made(-kYear, kCrashed, "BB"), Made(-kYear, kCrashed, "BB")},
     "unknown not-tried, forgiven",
     "unknown not-tried, forgiven"},
    {"an unclear end of the future", {Made(-kYear, kHostEnded, "--")}, kFirst, kFirst},
    {"an unknown of the future",
     {Made(-kYear, kEnded, "--")},
     "unknown a-reason, unclear",
     "unknown a-reason, unclear"},
    {"freezes of the future count",
     {Made(-kYear, kSystemEnded, "--"), Made(-kYear, kSystemEnded, "--")},
     fmt::format("broken system-ended, in {}, 2 failed", 395 * kDay + 1),
     fmt::format("broken system-ended, in {}, 2 failed", 395 * kDay + 1)},
    {"a failure after a clock was set back",
     {Made(-kYear, kEnded, "HH"), Made(59, kCrashed, "B<")},
     "broken a-reason, in 1, 1 failed",
     "unknown ended-before, in 1, 1 failed"},
};

TEST(PolicyTest, HasARowForEachCase)
{
    const Policy policy;
    for (const Row& row : kRows) {
        EXPECT_EQ(Show(Judge(DeviceKind::kOpenGL, row.fAttempts, kNow, policy, row.fFresh)),
                  row.fGL)
            << row.fName;
        EXPECT_EQ(Show(Judge(DeviceKind::kOpenCL, row.fAttempts, kNow, policy, row.fFresh)),
                  row.fCL)
            << row.fName;
    }
}

TEST(PolicyTest, EachNumberCanBeSet)
{
    Policy policy;
    policy.fMaxAge = 10;
    policy.fAbsentKept = 20;
    policy.fUnknownKept = 30;
    const auto show = [&policy](std::vector<Attempt> attempts) {
        return Show(Judge(DeviceKind::kOpenGL, attempts, kNow, policy));
    };
    EXPECT_EQ(show({Made(10, kEnded, "HH")}), "hardware a-reason, in 1");
    EXPECT_EQ(show({Made(20, kEnded, "AA")}), "absent a-reason, in 1");
    EXPECT_EQ(show({Made(30, kEnded, "--")}), "unknown a-reason, in 1");
    policy.fFirstPause = 5;
    policy.fPauseGrowth = 3;
    policy.fRetries = 3;
    policy.fForgiven = 1000;
    const Attempt crash = Made(1, kCrashed, "BB");
    EXPECT_EQ(show({crash}), "broken a-reason, in 4, 1 failed");
    EXPECT_EQ(show({crash, crash}), "broken a-reason, in 14, 2 failed");
    EXPECT_EQ(show({crash, crash, crash}), "broken a-reason, in 44, 3 failed");
    EXPECT_EQ(show({crash, crash, crash, crash}), "broken a-reason, in 1000, 4 failed");
    policy.fRetries = 0;
    EXPECT_EQ(show({crash}), "broken a-reason, in 1000, 1 failed");
    policy.fFreezeForgiven = 50;
    EXPECT_EQ(show({Made(51, kSystemEnded, "--")}), "unknown not-tried, forgiven");
    policy.fFreezeForgiven = 0;
    EXPECT_EQ(show({Made(-kYear, kSystemEnded, "--")}),
              fmt::format("unknown system-ended, in {}, 1 failed", kYear + 1001));
    policy.fMaxAge = 0;
    EXPECT_EQ(show({Made(0, kEnded, "HH")}), "hardware a-reason, in 1");
    policy.fMaxUnclear = 1;
    policy.fUnclearPause = 7;
    EXPECT_EQ(show({Made(1, kHostEnded, "--")}), "unknown host-ended, in 6");
}

// Of attempts without an answer the newest counts, whatever its reason is.
TEST(PolicyTest, TheLastAttemptWithoutAnAnswerIsShown)
{
    const Attempt unknown = Made(1, kEnded, "--");
    const Attempt nothing = Made(1, kNotStarted, "--");
    for (const std::vector<Attempt>& attempts :
         {std::vector<Attempt>{unknown, nothing}, std::vector<Attempt>{nothing, unknown},
          std::vector<Attempt>{unknown}, std::vector<Attempt>{nothing}})
        EXPECT_EQ(Judge(DeviceKind::kOpenGL, attempts, kNow, Policy()).fBasis, &attempts.back());
}

TEST(PolicyTest, PausesEndWithTheTimeThatForgives)
{
    Policy policy;
    policy.fRetries = 1000;
    const std::vector<Attempt> attempts(100, Made(0, kCrashed, "BB"));
    EXPECT_EQ(Show(Judge(DeviceKind::kOpenGL, attempts, kNow, policy)),
              fmt::format("broken a-reason, in {}, 100 failed", 7 * kDay));
}

TEST(PolicyTest, FindingsSayWhatHappened)
{
    const auto tell = [](const std::vector<Attempt>& attempts) {
        return Judge(DeviceKind::kOpenGL, attempts, kNow, Policy()).fFinding.fText;
    };
    const Attempt freeze = Made(100, kSystemEnded, "--");
    EXPECT_EQ(tell({}), "OpenGL has not been tried.");
    EXPECT_EQ(tell({freeze}), "The system ended while OpenGL was tried.");
    EXPECT_EQ(tell({freeze, freeze}), "The system ended 2 times while OpenGL was tried.");
    EXPECT_EQ(tell({Made(100, kKilled, "--")}),
              "Another process killed the child while OpenGL was tried.");
    EXPECT_EQ(tell({Made(100, kHostEnded, "--")}), "The host ended while OpenGL was tried.");
    EXPECT_EQ(tell({Made(kYear, kEnded, "HH")}), "What is known of OpenGL is too old.");
    EXPECT_EQ(tell({Made(100, kCrashed, "B-")}), "A sentence.") << "what the attempt found";
}

TEST(PolicyTest, WarningsSayWhatHappened)
{
    const auto warn = [](const std::vector<Attempt>& attempts) {
        return Judge(DeviceKind::kOpenGL, attempts, kNow, Policy()).fWarning;
    };
    const Attempt crash = Made(500, kCrashed, "BB");
    EXPECT_EQ(warn({crash, Made(1, kEnded, "HH")}), "An earlier attempt with OpenGL failed.");
    EXPECT_EQ(warn({crash, crash, Made(1, kEnded, "HH")}),
              "2 earlier attempts with OpenGL failed.");
    EXPECT_EQ(warn({Made(9, kEnded, "HH"), Made(1, kStopped, "--")}),
              "A later attempt gave no answer: How it ended.");
    EXPECT_EQ(warn({crash}), "");
}

// Whatever happened before, hardware is what the last attempt that says something found.
TEST(PolicyTest, HardwareIsNeverWrong)
{
    const std::vector<AttemptEnd> ends = {kEnded,      kCrashed, kHung,      kKilled,
                                          kNotStarted, kStopped, kHostEnded, kSystemEnded};
    std::vector<Attempt> kinds;
    for (const std::int64_t ago : {std::int64_t(100), 40 * kDay, -kYear})
        for (const AttemptEnd end : ends)
            for (const char* const letters : {"HH", "BB", "--"})
                kinds.push_back(Made(ago, end, letters));
    int hardware = 0;
    for (const Attempt& first : kinds)
        for (const Attempt& second : kinds)
            for (const Attempt& third : kinds) {
                const std::vector<Attempt> attempts = {first, second, third};
                const Outlook outlook = Judge(DeviceKind::kOpenGL, attempts, kNow, Policy());
                if (outlook.fFinding.fUsability != Usability::kHardware)
                    continue;
                ++hardware;
                ASSERT_NE(outlook.fBasis, nullptr);
                ASSERT_EQ(outlook.fBasis->fOpenGL.fUsability, Usability::kHardware);
                ASSERT_EQ(outlook.fBasis->fEnded, kNow - 100);
                for (const Attempt* later = outlook.fBasis + 1; later < &attempts[0] + 3; ++later)
                    ASSERT_TRUE(later->fOpenGL.fUsability == Usability::kUnknown &&
                                (later->fEnd == kNotStarted || later->fEnd == kStopped ||
                                 later->fEnd == kEnded || later->fEnded > kNow ||
                                 later->fEnded < kNow - 7 * kDay));
            }
    EXPECT_GT(hardware, 1000);
}

} // namespace
} // namespace assay_host
