// What the options of advise, state and check set, and all that the options of all commands say
// when they reject something.
#include "app/CommandLine.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using Words = std::vector<std::string>;

template <typename Kind>
Kind Parse(const Words& words)
{
    const Parsed parsed = ParseCommandLine(words);
    const Kind* const choice = parsed.fChoice ? std::get_if<Kind>(&*parsed.fChoice) : nullptr;
    EXPECT_NE(choice, nullptr) << parsed.fText;
    return choice == nullptr ? Kind() : *choice;
}

AdviseChoice ParseAdvise(Words words)
{
    words.insert(words.begin(), {"advise", "--state", "s"});
    return Parse<AdviseChoice>(words);
}

TEST(CommandLineOfAdvise, HasDefaults)
{
    const AdviseChoice advise = ParseAdvise({});
    EXPECT_EQ(advise.fState, "s");
    EXPECT_EQ(advise.fChild.fProgram, "");
    EXPECT_EQ(advise.fChild.fTimeoutSeconds, 60);
    EXPECT_EQ(advise.fFormat, AdviceFormat::kText);
    EXPECT_EQ(advise.fNeed, Need::kOpenGL);
    EXPECT_FALSE(advise.fDryRun);
    EXPECT_FALSE(advise.fFresh);
    EXPECT_EQ(advise.fWaitSeconds, 10);
    EXPECT_EQ(advise.fMaxAgeDays, 30);
    EXPECT_EQ(advise.fPauseSeconds, 60);
    EXPECT_EQ(advise.fPauseGrowth, 60U);
    EXPECT_EQ(advise.fRetries, 2U);
    EXPECT_EQ(advise.fForgiveDays, 7);
    EXPECT_EQ(advise.fForgiveFreezeDays, 30);
    EXPECT_EQ(advise.fKeepAbsentSeconds, 600);
    EXPECT_EQ(advise.fKeepUnknownSeconds, 60);
    EXPECT_EQ(advise.fUnclear, 3U);
    EXPECT_EQ(advise.fUnclearPauseSeconds, 600);
}

TEST(CommandLineOfAdvise, HasAnOptionForEachField)
{
    EXPECT_EQ(ParseAdvise({"--assay", "a b"}).fChild.fProgram, "a b");
    EXPECT_EQ(ParseAdvise({"--timeout", "1.5"}).fChild.fTimeoutSeconds, 1.5);
    EXPECT_EQ(ParseAdvise({"--format", "text"}).fFormat, AdviceFormat::kText);
    EXPECT_EQ(ParseAdvise({"--format", "env"}).fFormat, AdviceFormat::kVariables);
    EXPECT_EQ(ParseAdvise({"--format", "json"}).fFormat, AdviceFormat::kJson);
    EXPECT_EQ(ParseAdvise({"--need", "opengl"}).fNeed, Need::kOpenGL);
    EXPECT_EQ(ParseAdvise({"--need", "opencl"}).fNeed, Need::kOpenCL);
    EXPECT_EQ(ParseAdvise({"--need", "both"}).fNeed, Need::kBoth);
    EXPECT_TRUE(ParseAdvise({"--dry-run"}).fDryRun);
    EXPECT_TRUE(ParseAdvise({"--fresh"}).fFresh);
    EXPECT_EQ(ParseAdvise({"--wait", "2.5"}).fWaitSeconds, 2.5);
    EXPECT_EQ(ParseAdvise({"--max-age", "0.5"}).fMaxAgeDays, 0.5);
    EXPECT_EQ(ParseAdvise({"--pause", "1"}).fPauseSeconds, 1);
    EXPECT_EQ(ParseAdvise({"--forgive", "3"}).fForgiveDays, 3);
    EXPECT_EQ(ParseAdvise({"--forgive-freeze", "4"}).fForgiveFreezeDays, 4);
    EXPECT_EQ(ParseAdvise({"--keep-absent", "5"}).fKeepAbsentSeconds, 5);
    EXPECT_EQ(ParseAdvise({"--keep-unknown", "6"}).fKeepUnknownSeconds, 6);
    EXPECT_EQ(ParseAdvise({"--unclear-pause", "7"}).fUnclearPauseSeconds, 7);
}

TEST(CommandLineOfAdvise, LimitsItsCounts)
{
    EXPECT_EQ(ParseAdvise({"--pause-growth", "1"}).fPauseGrowth, 1U);
    EXPECT_EQ(ParseAdvise({"--pause-growth", "1000"}).fPauseGrowth, 1000U);
    EXPECT_EQ(ParseAdvise({"--retries", "0"}).fRetries, 0U);
    EXPECT_EQ(ParseAdvise({"--retries", "1000"}).fRetries, 1000U);
    EXPECT_EQ(ParseAdvise({"--unclear", "1"}).fUnclear, 1U);
    EXPECT_EQ(ParseAdvise({"--unclear", "1000"}).fUnclear, 1000U);
    for (const Words& words : {Words{"--pause-growth", "0"},
                               {"--unclear", "0"},
                               {"--pause-growth", "1001"},
                               {"--retries", "1001"},
                               {"--unclear", "1001"}}) {
        const Parsed parsed =
            ParseCommandLine({"advise", "--state", "s", words.front(), words.back()});
        EXPECT_FALSE(parsed.fChoice) << testing::PrintToString(words);
        EXPECT_EQ(parsed.fStatus, kErrorStatus);
    }
}

TEST(CommandLineOfState, NamesItsActions)
{
    const auto of = [](const Words& words) {
        Words all = {"state", "--state", "s"};
        all.insert(all.end(), words.begin(), words.end());
        return Parse<StateChoice>(all);
    };
    EXPECT_EQ(of({"list"}).fAction, StateAction::kList);
    EXPECT_EQ(of({"list"}).fState, "s");
    EXPECT_THAT(of({"list"}).fWords, IsEmpty());
    EXPECT_EQ(of({"show"}).fAction, StateAction::kShow);
    EXPECT_THAT(of({"show", "a", "b"}).fWords, ElementsAre("a", "b"));
    EXPECT_EQ(of({"forget"}).fAction, StateAction::kForget);
    EXPECT_THAT(of({"forget", "a"}).fWords, ElementsAre("a"));
    EXPECT_EQ(of({"set", "opengl=auto"}).fAction, StateAction::kSet);
    EXPECT_THAT(of({"set", "opengl=auto", "x"}).fWords, ElementsAre("opengl=auto", "x"));
}

TEST(CommandLineOfCheck, HasAnOptionForEachField)
{
    const auto check = Parse<CheckChoice>({"check", "--require", "a", "--require", "b",
                                           "--requirements", "c", "--requirements", "d", "--assay",
                                           "e", "--timeout", "2", "--", "-x", "y"});
    EXPECT_THAT(check.fRequirements, ElementsAre("a", "b"));
    EXPECT_THAT(check.fRequirementFiles, ElementsAre("c", "d"));
    EXPECT_THAT(check.fReports, IsEmpty());
    EXPECT_EQ(check.fChild.fProgram, "e");
    EXPECT_EQ(check.fChild.fTimeoutSeconds, 2);
    EXPECT_THAT(check.fChild.fArgs, ElementsAre("-x", "y"));
    const auto stored = Parse<CheckChoice>({"check", "--requirements=c", "--from=f", "--from=g"});
    EXPECT_THAT(stored.fReports, ElementsAre("f", "g"));
    EXPECT_EQ(stored.fChild.fTimeoutSeconds, 60);
}

struct Row {
    Words fWords;
    std::string fMessage;
};

// The texts of the program itself, to the letter. Those of the library for options may change with
// its version.
TEST(CommandLine, SaysWhatItRejects)
{
    const std::string kNoNumber = R"("-1" is not a number of at least 0)";
    const Row kRows[] = {
        {{"run", "--timeout", "-1"}, "--timeout: " + kNoNumber},
        {{"run", "--raw", "--format", "html"}, "--raw: only with --format text"},
        {{"run", "--schema", "1", "--format", "html"},
         "--schema: only with --format json or jsonl"},
        {{"torture", "--timeout", "-1"}, "--timeout: " + kNoNumber},
        {{"torture", "--", "-crashAfter=1"}, "-crashAfter=1: torture sets this itself"},
        {{"torture", "--", "-x", "-throwAfter=1"}, "-throwAfter=1: torture sets this itself"},
        {{"diff", "--tolerance", "-1", "a", "b"}, "--tolerance: " + kNoNumber},
        {{"show", "a", "--schema", "2"}, "--schema: only with --format json"},
        {{"show", "a", "--schema", "2", "--format", "nfd"}, "--schema: only with --format json"},
        {{"check", "--require", "x", "--from", "y", "--assay", "z"},
         "--assay: only without --from"},
        {{"check", "--require", "x", "--from", "y", "--timeout", "1"},
         "--timeout: only without --from"},
        {{"check", "--require", "x", "--from", "y", "--", "z"}, "z: only without --from"},
        {{"state", "--state", "s", "set"}, "set: opengl=VALUE or opencl=VALUE is missing"},
    };
    for (const Row& row : kRows) {
        const Parsed parsed = ParseCommandLine(row.fWords);
        EXPECT_FALSE(parsed.fChoice) << row.fMessage;
        EXPECT_EQ(parsed.fText,
                  "assay-host: " + row.fMessage + "\nRun \"assay-host --help\" for the usage.\n");
    }
    for (const char* option : {"--wait", "--max-age", "--pause", "--forgive", "--forgive-freeze",
                               "--keep-absent", "--keep-unknown", "--unclear-pause"})
        EXPECT_EQ(ParseCommandLine({"advise", "--state", "s", option, "-1"}).fText,
                  std::string("assay-host: ") + option + ": " + kNoNumber +
                      "\nRun \"assay-host --help\" for the usage.\n");
}

// Of the library's texts, only what they name is compared.
TEST(CommandLine, NamesTheOptionOrWordThatItRejects)
{
    const Row kRows[] = {
        {{"run", "--nope"}, "--nope"},
        {{"run", "word"}, "word"},
        {{"run", "--format", "xml"}, "{text,json,jsonl,html,prometheus,nfd,ansible}"},
        {{"run", "--schema", "3", "--format", "json"}, "{1,2}"},
        {{"run", "--need", "x"}, "{opengl,opencl,both}"},
        {{"torture", "--kind", "x"}, "{crash,throw,both}"},
        {{"diff", "a", "b", "--"}, "--"},
        {{"show", "a", "--format", "x"}, "{text,json,html,prometheus,nfd,ansible}"},
        {{"show", "a", "--schema", "3", "--format", "json"}, "{1,2}"},
        {{"check"}, "--require, --requirements or --baseline is required"},
        {{"advise"}, "--state"},
        {{"advise", "--state", "s", "--format", "x"}, "{text,env,json}"},
        {{"advise", "--state", "s", "--need", "x"}, "{opengl,opencl,both}"},
        {{"state", "list"}, "--state"},
        {{"state", "--state", "s"}, "ACTION"},
        {{"state", "--state", "s", "do"}, "{list,show,forget,set}"},
        {{"state", "--state", "s", "list", "more"}, "more"},
    };
    for (const Row& row : kRows) {
        const Parsed parsed = ParseCommandLine(row.fWords);
        EXPECT_FALSE(parsed.fChoice) << row.fMessage;
        EXPECT_THAT(parsed.fText, testing::StartsWith("assay-host: "));
        EXPECT_THAT(parsed.fText, testing::HasSubstr(row.fMessage));
    }
}

TEST(CommandLine, TakesNoEmptyText)
{
    for (const Words& words : {Words{"check", "--require", ""},
                               {"check", "--requirements", ""},
                               {"check", "--require", "x", "--from", ""},
                               {"state", "list", "--state", ""},
                               {"advise", "--state", ""},
                               {"show", "a", "--output", ""}}) {
        const Parsed parsed = ParseCommandLine(words);
        EXPECT_FALSE(parsed.fChoice) << testing::PrintToString(words);
        EXPECT_EQ(parsed.fStatus, kErrorStatus);
    }
}

} // namespace
} // namespace assay_host
