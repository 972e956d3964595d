#include "app/CommandLine.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <sstream>

#include <CLI/CLI.hpp>
#include <fmt/format.h>

#include "report/Bytes.h"

namespace assay_host {

namespace {

constexpr char kChildWord[] = "--";
constexpr std::size_t kHelpColumn = 26;

// Words behind the first "--" are the child's, whatever they look like.
struct Words {
    std::vector<std::string> fOwn;
    std::vector<std::string> fChild;
    bool fHasChild = false;
};

Words Split(const std::vector<std::string>& words)
{
    Words result;
    const auto mark = std::find(words.begin(), words.end(), kChildWord);
    result.fOwn.assign(words.begin(), mark);
    result.fHasChild = mark != words.end();
    if (result.fHasChild)
        result.fChild.assign(mark + 1, words.end());
    return result;
}

// Usage lines as a person types them.
class HelpFormatter : public CLI::Formatter {
public:
    HelpFormatter() { column_width(kHelpColumn); }

    void AddUsage(const std::string& command, const std::string& usage)
    {
        fUsages[command] = usage;
    }

    std::string make_usage(const CLI::App* app, std::string /*name*/) const override
    {
        return "usage: assay-host " + fUsages.at(app->get_name()) + "\n";
    }

private:
    std::map<std::string, std::string> fUsages;
};

// A number of seconds or a part: nothing that isn't finite, and nothing below 0.
std::string CheckNumber(const std::string& text)
{
    double value = 0;
    if (!CLI::detail::lexical_cast(text, value) || !std::isfinite(value) || value < 0)
        return '"' + text + "\" is no number from 0 on";
    return {};
}

std::string CheckGiven(const std::string& text)
{
    return text.empty() ? "must not be empty" : "";
}

CLI::Validator MakeGivenCheck(const char* what)
{
    return {CheckGiven, what};
}

void AddChildOptions(CLI::App& command, ChildChoice& child)
{
    command
        .add_option("--assay", child.fProgram, "the program [beside assay-host, or on the PATH]")
        ->option_text("PATH")
        ->check(MakeGivenCheck("PATH"));
    command.add_option("--timeout", child.fTimeoutSeconds, "kill it then, 0: never [60]")
        ->option_text("SECONDS")
        ->check(CLI::Validator(CheckNumber, "SECONDS"));
}

class Parser {
public:
    Parser()
    {
        fApp.name("assay-host");
        fFormatter->AddUsage("assay-host", "run|torture|diff [option...]");
        fApp.formatter(fFormatter);
        fApp.set_help_flag("-h,--help", "show this text");
        fApp.set_version_flag("--version", "assay-host " ASSAY_VERSION, "show the version");
        fApp.require_subcommand(1);
        fApp.footer("\"assay-host COMMAND --help\" tells more of each.");
        AddRun();
        AddTorture();
        AddDiff();
    }

    Parsed Parse(const std::vector<std::string>& words)
    {
        const Words split = Split(words);
        try {
            std::vector<std::string> own(split.fOwn.rbegin(), split.fOwn.rend());
            fApp.parse(own);
            return {Choose(split), 0, {}};
        } catch (const CLI::ParseError& error) {
            std::ostringstream out;
            std::ostringstream err;
            if (fApp.exit(error, out, err) == 0)
                return {std::nullopt, 0, out.str()};
            const bool isDiff = !words.empty() && words.front() == "diff";
            return {std::nullopt, isDiff ? kDiffTroubleStatus : kTroubleStatus, GetText(error)};
        }
    }

private:
    static std::string GetText(const CLI::ParseError& error)
    {
        return fmt::format("assay-host: {}\nassay-host --help tells more.\n",
                           ShowBytes(error.what()));
    }

    CLI::App* AddCommand(const char* name, const char* what, const char* usage, const char* footer)
    {
        CLI::App* const command = fApp.add_subcommand(name, what);
        fFormatter->AddUsage(name, usage);
        command->footer(footer);
        return command;
    }

    void AddRun()
    {
        fRunCommand =
            AddCommand("run", "run assay, survive it, and show what it found",
                       "run [option...] [-- child option...]",
                       "exit status: 0 complete, 1 failed tests, 2 usage error of the child,\n"
                       "  3 crashed, 4 hung and killed, 5 never started, 6 interrupted,\n"
                       "  10 trouble with the command line or the output");
        AddChildOptions(*fRunCommand, fRun.fChild);
        fRunCommand->add_option("--format", fFormat, "text, json or jsonl [text]")
            ->option_text("FORMAT")
            ->check(CLI::IsMember({"text", "json", "jsonl"}));
        fRunCommand->add_flag("--raw", fRun.fRaw,
                              "the child's own lines first, as they come; with text");
        fRunCommand->add_option("--output", fRun.fOutput, "write there [standard output]")
            ->option_text("FILE")
            ->check(MakeGivenCheck("FILE"));
    }

    void AddTorture()
    {
        fTortureCommand =
            AddCommand("torture", "make assay fail at every step, and check each outcome",
                       "torture [option...] [-- child option...]",
                       "exit status: 0 all as predicted, 1 not, 5 never started, 6 interrupted,\n"
                       "  10 trouble with the command line or the output");
        AddChildOptions(*fTortureCommand, fTorture.fChild);
        fTortureCommand->add_option("--kind", fKind, "crash, throw or both [both]")
            ->option_text("KIND")
            ->check(CLI::IsMember({"crash", "throw", "both"}));
    }

    void AddDiff()
    {
        fDiffCommand =
            AddCommand("diff", "tell what changed between two reports", "diff [option...] A B",
                       "exit status: 0 same, 1 different, 2 trouble");
        fDiffCommand->add_option("A", fDiff.fBefore, "a report: json, jsonl, or as assay prints it")
            ->required()
            ->option_text(" ")
            ->check(MakeGivenCheck("FILE"));
        fDiffCommand->add_option("B", fDiff.fAfter, "the other one")
            ->required()
            ->option_text(" ")
            ->check(MakeGivenCheck("FILE"));
        fDiffCommand
            ->add_option("--tolerance", fDiff.fTolerance, "for measured numbers, as a part [0.1]")
            ->option_text("PART")
            ->check(CLI::Validator(CheckNumber, "PART"));
    }

    Choice Choose(const Words& words)
    {
        if (fDiffCommand->parsed()) {
            if (words.fHasChild)
                throw CLI::ExtrasError({kChildWord});
            return fDiff;
        }
        if (fTortureCommand->parsed()) {
            fTorture.fChild.fArgs = words.fChild;
            for (const std::string& word : words.fChild)
                if (word.rfind("-crashAfter=", 0) == 0 || word.rfind("-throwAfter=", 0) == 0)
                    throw CLI::ValidationError(word, "torture sets this itself");
            if (fKind != "throw")
                fTorture.fFailures.push_back(StepFailure::kCrash);
            if (fKind != "crash")
                fTorture.fFailures.push_back(StepFailure::kThrow);
            return fTorture;
        }
        fRun.fFormat = fFormat == "json"    ? Format::kJson
                       : fFormat == "jsonl" ? Format::kJsonLines
                                            : Format::kText;
        if (fRun.fRaw && fRun.fFormat != Format::kText)
            throw CLI::ValidationError("--raw", "only with --format text");
        fRun.fChild.fArgs = words.fChild;
        return fRun;
    }

    CLI::App fApp{"Runs assay as a child, survives whatever a driver does, says what came of it."};
    const std::shared_ptr<HelpFormatter> fFormatter = std::make_shared<HelpFormatter>();
    CLI::App* fRunCommand = nullptr;
    CLI::App* fTortureCommand = nullptr;
    CLI::App* fDiffCommand = nullptr;
    RunChoice fRun;
    TortureChoice fTorture;
    DiffChoice fDiff;
    std::string fFormat = "text";
    std::string fKind = "both";
};

} // namespace

Parsed ParseCommandLine(const std::vector<std::string>& words)
{
    return Parser().Parse(words);
}

} // namespace assay_host
