#include <limits>

#include <gmock/gmock.h>

#include "AppFixtures.h"

namespace assay {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();
constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();

class CommandLine : public testing::Test {
protected:
    // Returns the arguments that parsing leaves.
    Lines Parse(const Lines& options)
    {
        GPUAssayApp::Arguments arguments(options.begin(), options.end());
        app.ParseArguments(arguments);
        return {arguments.begin(), arguments.end()};
    }
    bool ParseOne(const std::string& argument)
    {
        GPUAssayApp::Arguments rest;
        return app.ParseArgument(argument, rest);
    }

    CapturedStderr err;
    TestApp app;
};

TEST_F(CommandLine, StartsWithItsDefaults)
{
    EXPECT_EQ(app.GetCrashAfter(), -1);
    EXPECT_EQ(app.GetThrowAfter(), -1);
    EXPECT_EQ(app.GetVerbose(), 0);
    EXPECT_EQ(app.GetTimeout(), 5);
    EXPECT_EQ(app.GetHang(), 0);
    EXPECT_EQ(app.GetAppName(), "");
    EXPECT_EQ(app.GetUsageName(), "");
}

TEST_F(CommandLine, StoresEachNumber)
{
    EXPECT_THAT(
        Parse({"-crashAfter=11", "-throwAfter=12", "-verbose=13", "-timeout=14", "-hang=15"}),
        IsEmpty());
    EXPECT_EQ(app.GetCrashAfter(), 11);
    EXPECT_EQ(app.GetThrowAfter(), 12);
    EXPECT_EQ(app.GetVerbose(), 13);
    EXPECT_EQ(app.GetTimeout(), 14);
    EXPECT_EQ(app.GetHang(), 15);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(CommandLine, AppReplacesTheName)
{
    app.SetAppName("first");
    EXPECT_THAT(Parse({"-app=Foo"}), IsEmpty());
    EXPECT_EQ(app.GetAppName(), "Foo");
}

TEST_F(CommandLine, StdoutPrintsAtOnceAndInOrder)
{
    EXPECT_THAT(Parse({"-stdout=one", "-stdout=two", "-stdout="}), IsEmpty());
    EXPECT_THAT(app.out, ElementsAre("one", "two", ""));
}

TEST_F(CommandLine, StderrPrintsAtOnce)
{
    EXPECT_THAT(Parse({"-stderr=one", "-stderr=two"}), IsEmpty());
    EXPECT_THAT(err.Take(), ElementsAre("one", "two"));
    EXPECT_THAT(app.out, IsEmpty());
}

TEST_F(CommandLine, CommentPrintsItsPrefix)
{
    EXPECT_THAT(Parse({"-comment=x", "-comment="}), IsEmpty());
    EXPECT_THAT(app.out, ElementsAre("# x", "# "));
}

TEST_F(CommandLine, OnlyTheFirstEqualSignSplits)
{
    Parse({"-stdout=a=b", "-stdout==", "-stdout=a=\"b\""});
    EXPECT_THAT(app.out, ElementsAre("a=b", "=", "a=\"b\""));
}

TEST_F(CommandLine, OneLayerOfQuotesIsRemoved)
{
    Parse({"-stdout=\"a b\"", "-stdout=\"", "-stdout=\"\"", "-stdout=\"\"x\"\"", "-stdout=\"a",
           "-stdout=a\"", "-stdout=\"a\\\"b\""});
    EXPECT_THAT(app.out, ElementsAre("a b", "\"", "", "\"x\"", "\"a", "a\"", "a\\\"b"));
}

TEST_F(CommandLine, LaterValuesReplaceEarlierOnes)
{
    Parse({"-verbose=1", "-verbose=2"});
    EXPECT_EQ(app.GetVerbose(), 2);
}

TEST_F(CommandLine, KeepsUnknownArgumentsInOrder)
{
    EXPECT_THAT(Parse({"foo", "-bogus", "-stdout=x", "--help", "-crashAfter", "-help=1", "-", "",
                       "-=", "-foo=1", "/stdout=x", "-Stdout=x", "-stdou=x", "-stdout x"}),
                ElementsAre("foo", "-bogus", "--help", "-crashAfter", "-help=1", "-", "",
                            "-=", "-foo=1", "/stdout=x", "-Stdout=x", "-stdou=x", "-stdout x"));
    EXPECT_THAT(app.out, ElementsAre("x"));
}

TEST_F(CommandLine, ANameWithoutAValueIsUnknown)
{
    const Lines bare = {"-crashAfter", "-throwAfter", "-app",     "-stdout",  "-stderr",
                        "-exit",       "-verbose",    "-timeout", "-comment", "-hang"};
    EXPECT_EQ(Parse(bare), bare);
}

TEST_F(CommandLine, HelpEndsParsingAtOnce)
{
    GPUAssayApp::Arguments arguments = {"-stdout=a", "-help", "-stdout=b"};
    EXPECT_THROW(app.ParseArguments(arguments), GPUAssayApp::UsageException);
    EXPECT_THAT(app.out, ElementsAre("a"));
}

TEST_F(CommandLine, ParseArgumentReturnsWhetherItIsAnOption)
{
    EXPECT_TRUE(ParseOne("-hang=1"));
    EXPECT_FALSE(ParseOne("hang=1"));
    EXPECT_FALSE(ParseOne(""));
    EXPECT_FALSE(ParseOne("-hangs=1"));
}

TEST_F(CommandLine, UsageAppendsItsTwelveLines)
{
    GPUAssayApp::Arguments lines = {"before"};
    app.Usage(lines);
    EXPECT_THAT(lines,
                ElementsAre("before", "usage: ", "    -help {show this message}",
                            "    -crashAfter=N {GPUAssayTester should crash after N steps}",
                            "    -throwAfter=N {GPUAssayTester should throw after N steps}",
                            "    -app=SomeApp {specify name of host app}",
                            "    -stdout=line_of_stdout {puts the line to stdout as-is}",
                            "    -stderr=line_of_stderr {puts the line to stderr as-is}",
                            "    -exit=N {app should exit with N}",
                            "    -verbose=N {verbosity level}",
                            "    -timeout=N {Mac only, SIGALRM kills assay after N seconds, if not "
                            "finished}",
                            "    -comment=line_of_comment {outputs '# line_of_comment'}",
                            "    -hang=N {before exit, sleep for N milliseconds}"));
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST(ParseInteger, ReadsCNotation)
{
    EXPECT_EQ(GPUAssayApp::ParseInteger("42"), 42);
    EXPECT_EQ(GPUAssayApp::ParseInteger("-42"), -42);
    EXPECT_EQ(GPUAssayApp::ParseInteger("+42"), 42);
    EXPECT_EQ(GPUAssayApp::ParseInteger(" \t42"), 42);
    EXPECT_EQ(GPUAssayApp::ParseInteger("0x1F"), 31);
    EXPECT_EQ(GPUAssayApp::ParseInteger("0X1f"), 31);
    EXPECT_EQ(GPUAssayApp::ParseInteger("017"), 15);
}

TEST(ParseInteger, TakesTheNumericPrefix)
{
    EXPECT_EQ(GPUAssayApp::ParseInteger("7seven"), 7);
    EXPECT_EQ(GPUAssayApp::ParseInteger("08"), 0);
    EXPECT_EQ(GPUAssayApp::ParseInteger("1.9"), 1);
    EXPECT_EQ(GPUAssayApp::ParseInteger("0x"), 0);
}

TEST(ParseInteger, IsZeroWithoutDigits)
{
    EXPECT_EQ(GPUAssayApp::ParseInteger(""), 0);
    EXPECT_EQ(GPUAssayApp::ParseInteger("abc"), 0);
    EXPECT_EQ(GPUAssayApp::ParseInteger("-"), 0);
}

TEST(ParseInteger, ClampsToThirtyTwoBits)
{
    EXPECT_EQ(GPUAssayApp::ParseInteger("2147483647"), kMax);
    EXPECT_EQ(GPUAssayApp::ParseInteger("2147483648"), kMax);
    EXPECT_EQ(GPUAssayApp::ParseInteger("4294967295"), kMax);
    EXPECT_EQ(GPUAssayApp::ParseInteger("0xFFFFFFFF"), kMax);
    EXPECT_EQ(GPUAssayApp::ParseInteger("99999999999999999999999"), kMax);
    EXPECT_EQ(GPUAssayApp::ParseInteger("-2147483648"), kMin);
    EXPECT_EQ(GPUAssayApp::ParseInteger("-2147483649"), kMin);
    EXPECT_EQ(GPUAssayApp::ParseInteger("-99999999999999999999999"), kMin);
}

// A subclass with an option of its own and one that takes a following argument.
class ExtendedApp : public TestApp {
public:
    bool ParseOption(const std::string& name, const std::string& value) override
    {
        if (name != "colour")
            return TestApp::ParseOption(name, value);
        colour = value;
        return true;
    }
    bool ParseArgument(const std::string& argument, Arguments& rest) override
    {
        if (argument != "-file" || rest.empty())
            return TestApp::ParseArgument(argument, rest);
        file = rest.front();
        rest.pop_front();
        return true;
    }

    std::string colour;
    std::string file;
};

TEST(CommandLineOverrides, AreCalled)
{
    ExtendedApp app;
    GPUAssayApp::Arguments arguments = {"-colour=red", "-file", "-stdout=name", "-stdout=x", "y"};
    app.ParseArguments(arguments);
    EXPECT_EQ(app.colour, "red");
    EXPECT_EQ(app.file, "-stdout=name");
    EXPECT_THAT(app.out, ElementsAre("x"));
    EXPECT_THAT(arguments, ElementsAre("y"));
}

} // namespace
} // namespace assay
