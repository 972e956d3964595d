// The application's options.
#include <optional>

#include "GPUAssayApp.h"
#include "pmutil/Options.h"

namespace assay {

void GPUAssayApp::Usage(Arguments& lines)
{
    static const std::string kPrefix = "    -";
    static constexpr const char* kOptionLines[] = {
        "help {show this message}",
        "crashAfter=N {GPUAssayTester should crash after N steps}",
        "throwAfter=N {GPUAssayTester should throw after N steps}",
        "app=SomeApp {specify name of host app}",
        "stdout=line_of_stdout {puts the line to stdout as-is}",
        "stderr=line_of_stderr {puts the line to stderr as-is}",
        "exit=N {app should exit with N}",
        "verbose=N {verbosity level}",
        "timeout=N {Mac only, SIGALRM kills assay after N seconds, if not finished}",
        "comment=line_of_comment {outputs '# line_of_comment'}",
        "hang=N {before exit, sleep for N milliseconds}",
    };

    lines.push_back("usage: " + fUsageName);
    for (const char* line : kOptionLines)
        lines.push_back(kPrefix + line);
}

void GPUAssayApp::ParseArguments(Arguments& arguments)
{
    Arguments leftovers;
    while (!arguments.empty()) {
        const std::string argument = std::move(arguments.front());
        arguments.pop_front();
        if (!ParseArgument(argument, arguments))
            leftovers.push_back(argument);
    }
    arguments.swap(leftovers);
}

bool GPUAssayApp::ParseArgument(const std::string& argument, Arguments& /*rest*/)
{
    static const std::string kHelp = "-help";
    if (argument == kHelp)
        throw UsageException();
    const std::optional<pmutil::Option> option = pmutil::SplitOption(argument);
    return option && ParseOption(option->fName, option->fValue);
}

bool GPUAssayApp::ParseOption(const std::string& name, const std::string& value)
{
    using App = GPUAssayApp;
    using Text = const std::string&;
    struct Option {
        const char* name;
        void (*perform)(App& app, Text value);
    };
    static constexpr Option kOptions[] = {
        {"crashAfter", [](App& app, Text text) { app.SetCrashAfter(ParseInteger(text)); }},
        {"throwAfter", [](App& app, Text text) { app.SetThrowAfter(ParseInteger(text)); }},
        {"app", [](App& app, Text text) { app.SetAppName(text); }},
        {"stdout", [](App& app, Text text) { app.Stdout(text); }},
        {"stderr", [](App& app, Text text) { app.Stderr(text); }},
        {"exit", [](App& app, Text text) { app.fExitStatus = ParseInteger(text); }},
        {"verbose", [](App& app, Text text) { app.SetVerbose(ParseInteger(text)); }},
        {"timeout", [](App& app, Text text) { app.SetTimeout(ParseInteger(text)); }},
        {"comment", [](App& app, Text text) { app.Comment(text); }},
        {"hang", [](App& app, Text text) { app.SetHang(ParseInteger(text)); }},
    };

    for (const Option& option : kOptions) {
        if (name == option.name) {
            option.perform(*this, value);
            return true;
        }
    }
    return false;
}

std::int32_t GPUAssayApp::ParseInteger(const std::string& text)
{
    return pmutil::ParseInteger(text);
}

} // namespace assay
