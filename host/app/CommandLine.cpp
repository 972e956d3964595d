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

// The words before and after the first "--". The latter are the child's.
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

// Formats the usage lines.
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

std::string CheckNumber(const std::string& text)
{
    double value = 0;
    if (!CLI::detail::lexical_cast(text, value) || !std::isfinite(value) || value < 0)
        return '"' + text + "\" is not a number of at least 0";
    return {};
}

std::string CheckNotEmpty(const std::string& text)
{
    return text.empty() ? "must not be empty" : "";
}

CLI::Validator MakeNotEmptyCheck(const char* what)
{
    return {CheckNotEmpty, what};
}

void AddChildOptions(CLI::App& command, ChildChoice& child)
{
    command
        .add_option("--assay", child.fProgram, "program to run [beside assay-host, or on the PATH]")
        ->option_text("PATH")
        ->check(MakeNotEmptyCheck("PATH"));
    command
        .add_option("--timeout", child.fTimeoutSeconds,
                    "kill the child after this time, 0: never [60]")
        ->option_text("SECONDS")
        ->check(CLI::Validator(CheckNumber, "SECONDS"));
}

constexpr const char* kVersion = "assay-host " ASSAY_VERSION;

class Parser {
public:
    Parser()
    {
        fApp.name("assay-host");
        fFormatter->AddUsage("assay-host", "run|torture|diff|advise|state [option...]");
        fApp.formatter(fFormatter);
        fApp.set_help_flag("-h,--help", "show this text");
        fApp.set_version_flag("--version", kVersion, "show the version");
        fApp.require_subcommand(1);
        fApp.footer("\"assay-host COMMAND --help\" describes a command.");
        AddRun();
        AddTorture();
        AddDiff();
        AddAdvise();
        AddState();
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
            return {std::nullopt, isDiff ? kDiffErrorStatus : kErrorStatus, GetText(error)};
        }
    }

private:
    static std::string GetText(const CLI::ParseError& error)
    {
        return fmt::format("assay-host: {}\nRun \"assay-host --help\" for the usage.\n",
                           ShowBytes(error.what()));
    }

    CLI::App* AddCommand(const char* name, const char* what, const char* usage, const char* footer)
    {
        CLI::App* const command = fApp.add_subcommand(name, what);
        fFormatter->AddUsage(name, usage);
        command->footer(footer);
        command->set_version_flag("--version", kVersion)->group(""); // not in the help of each
        return command;
    }

    void AddRun()
    {
        fRunCommand = AddCommand(
            "run", "run assay and show its report", "run [option...] [-- child option...]",
            "exit status: 0 complete, 1 failed tests, 2 usage error of the child,\n"
            "  3 crashed, 4 hung and killed, 5 never started, 6 interrupted,\n"
            "  10 error in the command line or the output;\n"
            "  with --need: 0 hardware, 20 software, 21 broken, 22 absent, 23 unknown");
        AddChildOptions(*fRunCommand, fRun.fChild);
        fRunCommand->add_option("--format", fFormat, "text, json or jsonl [text]")
            ->option_text("FORMAT")
            ->check(CLI::IsMember({"text", "json", "jsonl"}));
        fRunCommand->add_option("--schema", fRun.fSchema, "of json and jsonl, 1 or 2 [2]")
            ->option_text("NUMBER")
            ->check(CLI::IsMember({"1", "2"}));
        fRunCommand
            ->add_option("--need", fNeed, "opengl, opencl or both: exit by whether they work")
            ->option_text("WHAT")
            ->check(CLI::IsMember({"opengl", "opencl", "both"}));
        fRunCommand->add_flag("--identify", fRun.fIdentify, "name this machine in json and jsonl");
        fRunCommand->add_flag("--raw", fRun.fRaw,
                              "print the child's own lines first; only with text");
        fRunCommand->add_option("--output", fRun.fOutput, "write to this file [standard output]")
            ->option_text("FILE")
            ->check(MakeNotEmptyCheck("FILE"));
    }

    void AddTorture()
    {
        fTortureCommand =
            AddCommand("torture", "make assay fail at every step and check each outcome",
                       "torture [option...] [-- child option...]",
                       "exit status: 0 as predicted, 1 different, 5 never started, 6 interrupted,\n"
                       "  10 error in the command line or the output");
        AddChildOptions(*fTortureCommand, fTorture.fChild);
        fTortureCommand->add_option("--kind", fKind, "crash, throw or both [both]")
            ->option_text("KIND")
            ->check(CLI::IsMember({"crash", "throw", "both"}));
    }

    void AddDiff()
    {
        fDiffCommand =
            AddCommand("diff", "show the differences between two reports", "diff [option...] A B",
                       "exit status: 0 same, 1 different, 2 error");
        fDiffCommand->add_option("A", fDiff.fBefore, "a report: json, jsonl, or as assay prints it")
            ->required()
            ->option_text(" ")
            ->check(MakeNotEmptyCheck("FILE"));
        fDiffCommand->add_option("B", fDiff.fAfter, "the other report")
            ->required()
            ->option_text(" ")
            ->check(MakeNotEmptyCheck("FILE"));
        fDiffCommand
            ->add_option("--tolerance", fDiff.fTolerance,
                         "of measurements, relative to the larger one [0.1]")
            ->option_text("FRACTION")
            ->check(CLI::Validator(CheckNumber, "FRACTION"));
    }

    void AddStateFolder(CLI::App& command, std::string& folder)
    {
        command.add_option("--state", folder, "folder of what is remembered")
            ->required()
            ->option_text("FOLDER")
            ->check(MakeNotEmptyCheck("FOLDER"));
    }

    static void AddNumber(CLI::App& command, const char* name, double& number, const char* what,
                          const char* unit)
    {
        command.add_option(name, number, what)
            ->option_text(unit)
            ->check(CLI::Validator(CheckNumber, unit));
    }

    void AddAdvise()
    {
        fAdviseCommand =
            AddCommand("advise", "tell from memory, or by one attempt, what can be used",
                       "advise --state FOLDER [option...]",
                       "exit status: 0 hardware, 20 software, 21 broken, 22 absent, 23 unknown,\n"
                       "  6 interrupted, 10 error in the command line or the output");
        AddStateFolder(*fAdviseCommand, fAdvise.fState);
        AddChildOptions(*fAdviseCommand, fAdvise.fChild);
        fAdviseCommand->add_option("--format", fAdviceFormat, "text, env or json [text]")
            ->option_text("FORMAT")
            ->check(CLI::IsMember({"text", "env", "json"}));
        fAdviseCommand->add_option("--need", fAdviceNeed, "opengl, opencl or both [opengl]")
            ->option_text("WHAT")
            ->check(CLI::IsMember({"opengl", "opencl", "both"}));
        AddNumber(*fAdviseCommand, "--wait", fAdvise.fWaitSeconds,
                  "wait for the attempt of another process [10]", "SECONDS");
        AddNumber(*fAdviseCommand, "--max-age", fAdvise.fMaxAgeDays,
                  "try again what is older than this [30]", "DAYS");
        fAdviseCommand->add_flag("--fresh", fAdvise.fFresh, "try again at any age");
        AddNumber(*fAdviseCommand, "--pause", fAdvise.fPauseSeconds,
                  "before the next attempt after a failure [60]", "SECONDS");
        fAdviseCommand
            ->add_option("--retries", fAdvise.fRetries, "attempts after a first failure [2]")
            ->option_text("NUMBER")
            ->check(CLI::Range(0, 1000));
        AddNumber(*fAdviseCommand, "--forgive", fAdvise.fForgiveDays,
                  "failures older than this don't count [7]", "DAYS");
        fAdviseCommand->add_flag("--dry-run", fAdvise.fDryRun,
                                 "show what the next call would do, without doing it");
    }

    void AddState()
    {
        fStateCommand =
            AddCommand("state", "show or change what advise remembers",
                       "state list|show|forget|set --state FOLDER [WORD...]",
                       "list: the entries, one for each state of the machine\n"
                       "show [ENTRY...]: all that is known\n"
                       "forget [ENTRY...]: without an entry, everything\n"
                       "set opengl=VALUE opencl=VALUE: hardware, software, absent, auto\n"
                       "exit status: 0 done, 10 error");
        fStateCommand->add_option("ACTION", fAction, "list, show, forget or set")
            ->required()
            ->option_text(" ")
            ->check(CLI::IsMember({"list", "show", "forget", "set"}));
        fStateCommand->add_option("WORD", fState.fWords, "what to act on")->option_text(" ");
        AddStateFolder(*fStateCommand, fState.fState);
    }

    AdviseChoice ChooseAdvise(const Words& words)
    {
        if (words.fHasChild)
            throw CLI::ExtrasError({kChildWord});
        fAdvise.fFormat = fAdviceFormat == "json"  ? AdviceFormat::kJson
                          : fAdviceFormat == "env" ? AdviceFormat::kVariables
                                                   : AdviceFormat::kText;
        fAdvise.fNeed = ReadNeed(fAdviceNeed);
        return fAdvise;
    }

    StateChoice ChooseState(const Words& words)
    {
        if (words.fHasChild)
            throw CLI::ExtrasError({kChildWord});
        fState.fAction = fAction == "show"     ? StateAction::kShow
                         : fAction == "forget" ? StateAction::kForget
                         : fAction == "set"    ? StateAction::kSet
                                               : StateAction::kList;
        if (fState.fAction == StateAction::kList && !fState.fWords.empty())
            throw CLI::ExtrasError(fState.fWords);
        if (fState.fAction == StateAction::kSet && fState.fWords.empty())
            throw CLI::ValidationError("set", "opengl=VALUE or opencl=VALUE is missing");
        return fState;
    }

    static Need ReadNeed(const std::string& need)
    {
        return need == "opengl"   ? Need::kOpenGL
               : need == "opencl" ? Need::kOpenCL
               : need == "both"   ? Need::kBoth
                                  : Need::kNothing;
    }

    CommandChoice Choose(const Words& words)
    {
        if (fAdviseCommand->parsed())
            return ChooseAdvise(words);
        if (fStateCommand->parsed())
            return ChooseState(words);
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
        if (fRunCommand->count("--schema") > 0 && fRun.fFormat == Format::kText)
            throw CLI::ValidationError("--schema", "only with --format json or jsonl");
        fRun.fNeed = ReadNeed(fNeed);
        fRun.fChild.fArgs = words.fChild;
        return fRun;
    }

    CLI::App fApp{"Runs assay as a child process, survives its failures, and shows its report."};
    const std::shared_ptr<HelpFormatter> fFormatter = std::make_shared<HelpFormatter>();
    CLI::App* fRunCommand = nullptr;
    CLI::App* fTortureCommand = nullptr;
    CLI::App* fDiffCommand = nullptr;
    CLI::App* fAdviseCommand = nullptr;
    CLI::App* fStateCommand = nullptr;
    RunChoice fRun;
    TortureChoice fTorture;
    DiffChoice fDiff;
    AdviseChoice fAdvise;
    StateChoice fState;
    std::string fFormat = "text";
    std::string fKind = "both";
    std::string fNeed;
    std::string fAdviceFormat = "text";
    std::string fAdviceNeed = "opengl";
    std::string fAction;
};

} // namespace

Parsed ParseCommandLine(const std::vector<std::string>& words)
{
    return Parser().Parse(words);
}

} // namespace assay_host
