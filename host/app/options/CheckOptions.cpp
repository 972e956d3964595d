#include <initializer_list>

#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class CheckOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"check", "hold this machine, or stored reports, to requirements",
                "check [option...] [REPORT...] [-- child option...]",
                "A requirement is a key, a relation and a value: 'GLVersion>=3.3',\n"
                "  'all GLFrameBufferOK==1', 'opengl.devices>=2', 'opencl.usable==hardware'\n"
                "exit status: 0 met, 7 not met, 1 to 6 as run if the run isn't complete,\n"
                "  10 error in the command line, a file or the output"};
    }

    void Add(CLI::App& command) override
    {
        AddFiles(command, "REPORT", fReports,
                 "a stored report to check instead of a run, as --from");
        AddTexts(command, "--require", fChoice.fRequirements, "a requirement; may be repeated",
                 "TEXT");
        AddTexts(command, "--requirements", fChoice.fRequirementFiles,
                 "a file of them; may be repeated", "FILE");
        AddTexts(command, "--from", fChoice.fReports,
                 "check a stored report, not a run; may be repeated", "FILE");
        AddText(command, "--state", fChoice.fState, "check what advise remembers, without a run",
                "FOLDER");
        AddNumber(command, "--max-age", fChoice.fMaxAgeDays,
                  "what is older there isn't known any more [30]", "DAYS");
        AddText(command, "--baseline", fChoice.fBaseline, "the report of a good machine, to be as",
                "FILE");
        AddNumber(command, "--tolerance", fChoice.fTolerance,
                  "by which a measurement may be below it [0.1]", "FRACTION");
        AddChildOptions(command, fChoice.fChild);
    }

    bool TakesChildWords() const override { return true; }

    CommandChoice Choose(const CLI::App& command,
                         const std::vector<std::string>& childWords) override
    {
        if (fChoice.fRequirements.empty() && fChoice.fRequirementFiles.empty() &&
            fChoice.fBaseline.empty())
            throw CLI::RequiredError("--require, --requirements or --baseline");
        if (command.count("--tolerance") > 0 && fChoice.fBaseline.empty())
            throw CLI::ValidationError("--tolerance", "only with --baseline");
        fChoice.fReports.insert(fChoice.fReports.end(), fReports.begin(), fReports.end());
        if (!fChoice.fReports.empty())
            Refuse(command, {"--state", "--assay", "--timeout"}, childWords, "only without --from");
        if (!fChoice.fState.empty())
            Refuse(command, {"--baseline", "--timeout"}, childWords, "only without --state");
        if (command.count("--max-age") > 0 && fChoice.fState.empty())
            throw CLI::ValidationError("--max-age", "only with --state");
        fChoice.fChild.fArgs = childWords;
        return fChoice;
    }

private:
    static void Refuse(const CLI::App& command, std::initializer_list<const char*> options,
                       const std::vector<std::string>& childWords, const char* reason)
    {
        for (const char* option : options)
            if (command.count(option) > 0)
                throw CLI::ValidationError(option, reason);
        if (!childWords.empty())
            throw CLI::ValidationError(childWords.front(), reason);
    }

    CheckChoice fChoice;
    std::vector<std::string> fReports;
};

} // namespace

std::unique_ptr<CommandOptions> MakeCheckOptions()
{
    return std::make_unique<CheckOptions>();
}

} // namespace assay_host
