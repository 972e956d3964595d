#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class AdviseOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"advise", "tell from memory, or by one attempt, what can be used",
                "advise --state FOLDER [option...]",
                "exit status: 0 hardware, 20 software, 21 broken, 22 absent, 23 unknown,\n"
                "  6 interrupted, 10 error in the command line or the output"};
    }

    void Add(CLI::App& command) override
    {
        AddStateFolder(command, fChoice.fState);
        AddChildOptions(command, fChoice.fChild);
        AddWord(command, "--format", fFormat, "text, env or json [text]", "FORMAT",
                {"text", "env", "json"});
        AddWord(command, "--need", fNeed, "opengl, opencl or both [opengl]", "WHAT",
                {"opengl", "opencl", "both"});
        AddNumber(command, "--wait", fChoice.fWaitSeconds,
                  "wait for the attempt of another process [10]", "SECONDS");
        AddNumber(command, "--max-age", fChoice.fMaxAgeDays,
                  "try again what is older than this [30]", "DAYS");
        command.add_flag("--fresh", fChoice.fFresh, "try again at any age");
        AddNumber(command, "--pause", fChoice.fPauseSeconds,
                  "before the next attempt after a failure [60]", "SECONDS");
        AddCount(command, "--pause-growth", fChoice.fPauseGrowth,
                 "each further pause is longer by this [60]", "FACTOR", 1);
        AddCount(command, "--retries", fChoice.fRetries, "attempts after a first failure [2]",
                 "NUMBER", 0);
        AddNumber(command, "--forgive", fChoice.fForgiveDays,
                  "failures older than this don't count [7]", "DAYS");
        AddNumber(command, "--forgive-freeze", fChoice.fForgiveFreezeDays,
                  "ends of the system older than this don't count [30]", "DAYS");
        AddNumber(command, "--keep-absent", fChoice.fKeepAbsentSeconds,
                  "try again what is absent, after [600]", "SECONDS");
        AddNumber(command, "--keep-unknown", fChoice.fKeepUnknownSeconds,
                  "try again what is unknown, after [60]", "SECONDS");
        AddCount(command, "--unclear", fChoice.fUnclear,
                 "attempts in a row that may show nothing [3]", "NUMBER", 1);
        AddNumber(command, "--unclear-pause", fChoice.fUnclearPauseSeconds,
                  "before the next attempt after so many [600]", "SECONDS");
        command.add_flag("--dry-run", fChoice.fDryRun,
                         "show what the next call would do, without doing it");
    }

    CommandChoice Choose(const CLI::App& /*command*/,
                         const std::vector<std::string>& /*childWords*/) override
    {
        fChoice.fFormat = fFormat == "json"  ? AdviceFormat::kJson
                          : fFormat == "env" ? AdviceFormat::kVariables
                                             : AdviceFormat::kText;
        fChoice.fNeed = ReadNeed(fNeed);
        return fChoice;
    }

private:
    static void AddCount(CLI::App& command, const std::string& name, unsigned& count,
                         const std::string& text, const std::string& value, unsigned min)
    {
        constexpr unsigned kMaxCount = 1000;
        command.add_option(name, count, text)
            ->option_text(value)
            ->check(CLI::Range(min, kMaxCount));
    }

    AdviseChoice fChoice;
    std::string fFormat = "text";
    std::string fNeed = "opengl";
};

} // namespace

std::unique_ptr<CommandOptions> MakeAdviseOptions()
{
    return std::make_unique<AdviseOptions>();
}

} // namespace assay_host
