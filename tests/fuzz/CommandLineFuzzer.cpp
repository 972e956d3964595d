// Feeds command lines to the application's parser, with the arguments separated by line ends.
// Checks that options take effect in order, that other arguments are left in order, and that only
// "-help" throws.
#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "GPUAssayApp.h"
#include "GPUAssayTester.h"
#include "Require.h"

namespace {

using assay::GPUAssayApp;

// Records the lines that options print.
class QuietApp : public GPUAssayApp {
public:
    void DoStdout(const std::string& text) override { out.push_back(text); }
    void DoStderr(const std::string& text) override { err.push_back(text); }

    std::vector<std::string> out;
    std::vector<std::string> err;
};

bool StartsWith(const std::string& text, const char* prefix)
{
    return text.rfind(prefix, 0) == 0;
}

bool IsOption(const std::string& argument)
{
    static const char* const kPrefixes[] = {
        "-crashAfter=", "-throwAfter=", "-app=",     "-stdout=",  "-stderr=",
        "-exit=",       "-verbose=",    "-timeout=", "-comment=", "-hang="};
    return std::any_of(std::begin(kPrefixes), std::end(kPrefixes),
                       [&](const char* prefix) { return StartsWith(argument, prefix); });
}

// Returns the line that a "-stdout=", "-comment=" or "-stderr=" prints, worked out independently of
// the parser.
std::string Printed(const std::string& argument)
{
    std::string value = argument.substr(argument.find('=') + 1);
    if (value.size() > 1 && value.front() == '"' && value.back() == '"') {
        value.pop_back();
        value.erase(0, 1);
    }
    return StartsWith(argument, "-comment=") ? "# " + value : value;
}

GPUAssayApp::Arguments Split(const std::string& text)
{
    GPUAssayApp::Arguments arguments;
    std::size_t begin = 0;
    for (std::size_t end = text.find('\n'); end != std::string::npos;
         end = text.find('\n', begin)) {
        arguments.push_back(text.substr(begin, end - begin));
        begin = end + 1;
    }
    arguments.push_back(text.substr(begin));
    return arguments;
}

void CheckInteger(const std::string& text)
{
    const std::int32_t value = GPUAssayApp::ParseInteger(text);
    const bool plain = !text.empty() && text.size() < 10 && text.front() != '0' &&
                       std::all_of(text.begin(), text.end(),
                                   [](char digit) { return digit >= '0' && digit <= '9'; });
    Require(!plain || value == std::stoi(text));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(data, data + size);
    CheckInteger(text);

    const GPUAssayApp::Arguments given = Split(text);
    const auto help = std::find(given.begin(), given.end(), "-help");
    std::vector<std::string> out;
    std::vector<std::string> err;
    GPUAssayApp::Arguments leftovers;
    for (auto argument = given.begin(); argument != help; ++argument)
        if (!IsOption(*argument))
            leftovers.push_back(*argument);
        else if (StartsWith(*argument, "-stdout=") || StartsWith(*argument, "-comment="))
            out.push_back(Printed(*argument));
        else if (StartsWith(*argument, "-stderr="))
            err.push_back(Printed(*argument));

    QuietApp app;
    GPUAssayApp::Arguments arguments = given;
    try {
        app.ParseArguments(arguments);
        Require(help == given.end());
        Require(arguments == leftovers);
    } catch (const GPUAssayApp::UsageException&) {
        Require(help != given.end());
    }
    Require(app.out == out);
    Require(app.err == err);
    return 0;
}
