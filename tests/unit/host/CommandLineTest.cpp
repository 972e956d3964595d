// What the options of assay-host set. The help texts and messages are compared by program tests.
#include "app/CommandLine.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::StartsWith;
using Words = std::vector<std::string>;

template <typename Kind>
Kind Parse(const Words& words)
{
    const Parsed parsed = ParseCommandLine(words);
    const Kind* const choice = parsed.fChoice ? std::get_if<Kind>(&*parsed.fChoice) : nullptr;
    EXPECT_NE(choice, nullptr) << parsed.fText;
    return choice == nullptr ? Kind() : *choice;
}

TEST(CommandLineOfRun, HasDefaults)
{
    const auto run = Parse<RunChoice>({"run"});
    EXPECT_EQ(run.fChild.fProgram, "");
    EXPECT_THAT(run.fChild.fArgs, IsEmpty());
    EXPECT_EQ(run.fChild.fTimeoutSeconds, 60);
    EXPECT_EQ(run.fFormat, Format::kText);
    EXPECT_EQ(run.fSchema, 2);
    EXPECT_EQ(run.fNeed, Need::kNothing);
    EXPECT_FALSE(run.fIdentify);
    EXPECT_FALSE(run.fRaw);
    EXPECT_EQ(run.fOutput, "");
}

TEST(CommandLineOfRun, HasAnOptionForEachField)
{
    const auto child =
        Parse<RunChoice>({"run", "--assay", "a b", "--timeout", "1.5", "--", "-x=1", "--", "y"});
    EXPECT_EQ(child.fChild.fProgram, "a b");
    EXPECT_EQ(child.fChild.fTimeoutSeconds, 1.5);
    EXPECT_THAT(child.fChild.fArgs, ElementsAre("-x=1", "--", "y"));
    const auto run = Parse<RunChoice>({"run", "--raw", "--output", "file"});
    EXPECT_FALSE(run.fIdentify);
    EXPECT_TRUE(run.fRaw);
    EXPECT_EQ(run.fOutput, "file");
    EXPECT_EQ(Parse<RunChoice>({"run", "--timeout=0"}).fChild.fTimeoutSeconds, 0);
}

TEST(CommandLineOfRun, NamesItsFormsAndNeeds)
{
    EXPECT_EQ(Parse<RunChoice>({"run", "--format=text", "--raw"}).fFormat, Format::kText);
    EXPECT_EQ(Parse<RunChoice>({"run", "--format", "json"}).fFormat, Format::kJson);
    EXPECT_EQ(Parse<RunChoice>({"run", "--format", "jsonl"}).fFormat, Format::kJsonLines);
    for (const char* form : {"json", "jsonl"}) {
        EXPECT_EQ(Parse<RunChoice>({"run", "--format", form, "--schema", "1"}).fSchema, 1);
        EXPECT_EQ(Parse<RunChoice>({"run", "--format", form, "--schema", "2"}).fSchema, 2);
    }
    for (const char* form : {"json", "jsonl", "html"})
        EXPECT_TRUE(Parse<RunChoice>({"run", "--format", form, "--identify"}).fIdentify);
    EXPECT_EQ(Parse<RunChoice>({"run", "--format", "prometheus"}).fFormat, Format::kPrometheus);
    EXPECT_EQ(Parse<RunChoice>({"run", "--format", "nfd"}).fFormat, Format::kNodeFeatures);
    EXPECT_EQ(Parse<RunChoice>({"run", "--format", "ansible"}).fFormat, Format::kAnsible);
    EXPECT_EQ(Parse<RunChoice>({"run", "--need", "opengl"}).fNeed, Need::kOpenGL);
    EXPECT_EQ(Parse<RunChoice>({"run", "--need", "opencl"}).fNeed, Need::kOpenCL);
    EXPECT_EQ(Parse<RunChoice>({"run", "--need", "both"}).fNeed, Need::kBoth);
}

TEST(CommandLineOfRun, RepeatsOrRunsForATime)
{
    EXPECT_FALSE(Parse<RunChoice>({"run"}).fSeries.IsAsked());
    const auto repeated = Parse<RunChoice>({"run", "--repeat", "30"});
    EXPECT_TRUE(repeated.fSeries.IsAsked());
    EXPECT_EQ(repeated.fSeries.fRuns, 30U);
    EXPECT_EQ(repeated.fSeries.fSeconds, 0);
    const auto timed = Parse<RunChoice>({"run", "--for", "1.5", "--repeat=2", "--raw"});
    EXPECT_EQ(timed.fSeries.fSeconds, 1.5);
    EXPECT_EQ(timed.fSeries.fRuns, 2U);
    EXPECT_EQ(Parse<RunChoice>({"run", "--repeat=1"}).fSeries.fRuns, 1U);
    EXPECT_EQ(Parse<RunChoice>({"run", "--repeat=100000"}).fSeries.fRuns, 100000U);
    EXPECT_EQ(Parse<RunChoice>({"run", "--for=0", "--repeat=1"}).fSeries.fSeconds, 0);
}

TEST(CommandLineOfTorture, NamesItsFailures)
{
    constexpr StepFailure kCrash = StepFailure::kCrash;
    constexpr StepFailure kThrow = StepFailure::kThrow;
    EXPECT_THAT(Parse<TortureChoice>({"torture"}).fFailures, ElementsAre(kCrash, kThrow));
    const auto of = [](const char* kind) {
        return Parse<TortureChoice>({"torture", "--kind", kind}).fFailures;
    };
    EXPECT_THAT(of("both"), ElementsAre(kCrash, kThrow));
    EXPECT_THAT(of("crash"), ElementsAre(kCrash));
    EXPECT_THAT(of("throw"), ElementsAre(kThrow));
    const auto child = Parse<TortureChoice>({"torture", "--assay=a", "--timeout", "2", "--",
                                             "-exit=1", "x-crashAfter=1", "crashAfter"});
    EXPECT_EQ(child.fChild.fProgram, "a");
    EXPECT_EQ(child.fChild.fTimeoutSeconds, 2);
    EXPECT_THAT(child.fChild.fArgs, ElementsAre("-exit=1", "x-crashAfter=1", "crashAfter"));
}

TEST(CommandLineOfCheck, TellsReportsFromTheValuesOfOptions)
{
    const auto check =
        Parse<CheckChoice>({"check", "a", "--require", "x>=1", "b", "--from", "c", "d"});
    EXPECT_THAT(check.fRequirements, ElementsAre("x>=1"));
    EXPECT_THAT(check.fReports, ElementsAre("c", "a", "b", "d"));
    EXPECT_EQ(Parse<CheckChoice>({"check", "--baseline", "a", "b"}).fBaseline, "a");
}

TEST(CommandLineOfDiff, HasFilesAndATolerance)
{
    EXPECT_THAT(Parse<DiffChoice>({"diff", "a", "b", "--identity", "c"}).fAfter,
                ElementsAre("b", "c"));
    const auto plain = Parse<DiffChoice>({"diff", "a", "b"});
    EXPECT_EQ(plain.fBefore, "a");
    EXPECT_THAT(plain.fAfter, ElementsAre("b"));
    EXPECT_EQ(plain.fTolerance, 0.1);
    EXPECT_FALSE(plain.fSeriesTolerance);
    EXPECT_FALSE(plain.fIdentity);
    EXPECT_EQ(plain.fFormat, Format::kText);
    EXPECT_EQ(plain.fOutput, "");
    EXPECT_TRUE(Parse<DiffChoice>({"diff", "a", "b", "--identity"}).fIdentity);
    EXPECT_EQ(Parse<DiffChoice>({"diff", "a", "b", "--format=json"}).fFormat, Format::kJson);
    EXPECT_EQ(Parse<DiffChoice>({"diff", "a", "b", "--format=html"}).fFormat, Format::kHtml);
    EXPECT_EQ(Parse<DiffChoice>({"diff", "a", "b", "--output", "c"}).fOutput, "c");
    EXPECT_FALSE(plain.fAll);
    EXPECT_TRUE(Parse<DiffChoice>({"diff", "--all", "a", "b"}).fAll);
    // On every system.
    const auto absolute = Parse<DiffChoice>({"diff", "/a/b.json", "/c"});
    EXPECT_EQ(absolute.fBefore, "/a/b.json");
    EXPECT_THAT(absolute.fAfter, ElementsAre("/c"));
    EXPECT_EQ(Parse<DiffChoice>({"diff", "--tolerance", "0", "a", "b"}).fTolerance, 0);
    EXPECT_EQ(Parse<DiffChoice>({"diff", "a", "b", "--tolerance=2.5"}).fTolerance, 2.5);
    // One that is asked for holds for series too, also if it is the usual one.
    EXPECT_EQ(Parse<DiffChoice>({"diff", "a", "b", "--tolerance=0.1"}).fSeriesTolerance, 0.1);
}

TEST(CommandLineOfShow, HasAFileAndAForm)
{
    const auto plain = Parse<ShowChoice>({"show", "a"});
    EXPECT_EQ(plain.fReport, "a");
    EXPECT_EQ(plain.fFormat, Format::kText);
    EXPECT_EQ(plain.fSchema, 2);
    EXPECT_EQ(plain.fOutput, "");
    const auto full =
        Parse<ShowChoice>({"show", "a", "--format=json", "--schema", "1", "--output", "b"});
    EXPECT_EQ(full.fFormat, Format::kJson);
    EXPECT_EQ(full.fSchema, 1);
    EXPECT_EQ(full.fOutput, "b");
    EXPECT_EQ(Parse<ShowChoice>({"show", "a", "--format=html"}).fFormat, Format::kHtml);
}

TEST(CommandLineOfCheck, HasAStateOrABaseline)
{
    const auto plain = Parse<CheckChoice>({"check", "--require=a"});
    EXPECT_EQ(plain.fState, "");
    EXPECT_EQ(plain.fMaxAgeDays, 30);
    EXPECT_EQ(plain.fBaseline, "");
    EXPECT_EQ(plain.fTolerance, 0.1);
    const auto state =
        Parse<CheckChoice>({"check", "--require=a", "--state", "s", "--max-age", "2.5"});
    EXPECT_EQ(state.fState, "s");
    EXPECT_EQ(state.fMaxAgeDays, 2.5);
    EXPECT_EQ(Parse<CheckChoice>({"check", "--baseline=b", "--tolerance=0"}).fTolerance, 0);
}

TEST(CommandLineOfBugReport, HasAnOptionForEachField)
{
    const auto plain = Parse<BugReportChoice>({"bugreport"});
    EXPECT_EQ(plain.fOutput, "");
    EXPECT_FALSE(plain.fYes);
    EXPECT_EQ(plain.fChild.fTimeoutSeconds, 60);
    const auto full = Parse<BugReportChoice>(
        {"bugreport", "--assay", "a", "--timeout=2", "--output", "o", "--yes", "--", "-x"});
    EXPECT_EQ(full.fChild.fProgram, "a");
    EXPECT_EQ(full.fChild.fTimeoutSeconds, 2);
    EXPECT_THAT(full.fChild.fArgs, ElementsAre("-x"));
    EXPECT_EQ(full.fOutput, "o");
    EXPECT_TRUE(full.fYes);
}

TEST(CommandLineOfExplain, HasKeys)
{
    EXPECT_THAT(Parse<ExplainChoice>({"explain"}).fKeys, IsEmpty());
    EXPECT_THAT(Parse<ExplainChoice>({"explain", "a", "b"}).fKeys, ElementsAre("a", "b"));
}

struct Row {
    Words fWords;
    int fStatus;
};

TEST(CommandLine, RejectsWhatNoCommandTakes)
{
    const Row kRows[] = {
        {{}, kErrorStatus},
        {{"bogus"}, kErrorStatus},
        {{"run", "x"}, kErrorStatus},
        {{"run", "--assay", ""}, kErrorStatus},
        {{"run", "--output", ""}, kErrorStatus},
        {{"run", "--timeout", ""}, kErrorStatus},
        {{"run", "--timeout", "-0.5"}, kErrorStatus},
        {{"run", "--timeout", "inf"}, kErrorStatus},
        {{"run", "--format", ""}, kErrorStatus},
        {{"run", "--format", "JSON"}, kErrorStatus},
        {{"run", "--raw", "--format", "json"}, kErrorStatus},
        {{"run", "--schema", "2"}, kErrorStatus},
        {{"run", "--schema", "0", "--format", "json"}, kErrorStatus},
        {{"run", "--need", "nothing"}, kErrorStatus},
        {{"run", "--repeat", "0"}, kErrorStatus},
        {{"run", "--repeat", "100001"}, kErrorStatus},
        {{"run", "--for", "0"}, kErrorStatus},
        {{"check", "--require=a", "--tolerance", "0.2"}, kErrorStatus},
        {{"check", "--require=a", "--max-age", "2"}, kErrorStatus},
        {{"bugreport", "x"}, kErrorStatus},
        {{"bugreport", "--output", ""}, kErrorStatus},
        {{"torture", "--format", "text"}, kErrorStatus},
        {{"torture", "--kind", ""}, kErrorStatus},
        {{"torture", "--", "-crashAfter=1"}, kErrorStatus},
        {{"torture", "--", "x", "-throwAfter="}, kErrorStatus},
        {{"show"}, kErrorStatus},
        {{"show", ""}, kErrorStatus},
        {{"show", "a", "b"}, kErrorStatus},
        {{"show", "a", "--format", "jsonl"}, kErrorStatus},
        {{"show", "a", "--schema", "1"}, kErrorStatus},
        {{"show", "a", "--raw"}, kErrorStatus},
        {{"diff"}, kDiffErrorStatus},
        {{"diff", "a"}, kDiffErrorStatus},
        {{"diff", "a", ""}, kDiffErrorStatus},
        {{"diff", "", "b"}, kDiffErrorStatus},
        {{"diff", "a", "b", ""}, kDiffErrorStatus},
        {{"diff", "a", "b", "--"}, kDiffErrorStatus},
        {{"diff", "a", "b", "--tolerance", "-1"}, kDiffErrorStatus},
    };
    for (const Row& row : kRows) {
        const Parsed parsed = ParseCommandLine(row.fWords);
        const std::string words = testing::PrintToString(row.fWords);
        EXPECT_FALSE(parsed.fChoice) << words;
        EXPECT_EQ(parsed.fStatus, row.fStatus) << words;
        EXPECT_THAT(parsed.fText, StartsWith("assay-host: ")) << words;
    }
}

TEST(CommandLine, HelpAndVersionAreNoFailures)
{
    for (const Words& words : {Words{"--help"}, {"-h"}, {"run", "-h"}, {"diff", "--help", "a"}}) {
        const Parsed parsed = ParseCommandLine(words);
        EXPECT_FALSE(parsed.fChoice);
        EXPECT_EQ(parsed.fStatus, 0);
        EXPECT_THAT(parsed.fText, testing::HasSubstr("usage: assay-host ")) << parsed.fText;
    }
    EXPECT_EQ(ParseCommandLine({"--version"}).fStatus, 0);
    EXPECT_THAT(ParseCommandLine({"--version"}).fText, StartsWith("assay-host "));
}

} // namespace
} // namespace assay_host
