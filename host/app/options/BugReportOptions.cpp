#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class BugReportOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"bugreport", "write an archive for a bug report",
                "bugreport [option...] [-- child option...]",
                "Lists what the archive has, and asks before it writes it.\n"
                "exit status: 0 written, also if assay crashed or hung, 1 declined,\n"
                "  6 interrupted, 10 error in the command line or the output"};
    }

    void Add(CLI::App& command) override
    {
        AddChildOptions(command, fChoice.fChild);
        AddText(command, "--output", fChoice.fOutput, "a new file [./assay-bugreport-TIME.zip]",
                "FILE");
        command.add_flag("--yes", fChoice.fYes, "write without asking");
    }

    bool TakesChildWords() const override { return true; }

    CommandChoice Choose(const CLI::App& /*command*/,
                         const std::vector<std::string>& childWords) override
    {
        fChoice.fChild.fArgs = childWords;
        return fChoice;
    }

private:
    BugReportChoice fChoice;
};

} // namespace

std::unique_ptr<CommandOptions> MakeBugReportOptions()
{
    return std::make_unique<BugReportOptions>();
}

} // namespace assay_host
