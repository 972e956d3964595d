#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class DiffOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"diff", "show the differences between two reports", "diff [option...] A B...",
                "exit status: 0 same, 1 different, 2 error"};
    }

    void Add(CLI::App& command) override
    {
        AddText(command, "A", fChoice.fBefore, "a report: json, jsonl, or as assay prints it",
                "FILE")
            ->required()
            ->option_text(" ");
        AddFiles(command, "B", fChoice.fAfter,
                 "the other report; of several, each is compared with A")
            ->required();
        AddWord(command, "--format", fFormat, "[text], json, html", "FORMAT",
                {"text", "json", "html"});
        AddText(command, "--output", fChoice.fOutput, "write to this file [standard output]",
                "FILE");
        AddNumber(command, "--tolerance", fChoice.fTolerance,
                  "of measurements, relative to the larger one [0.1]", "FRACTION");
        command.add_flag("--identity", fChoice.fIdentity,
                         "compare the machines' names and the times too");
        command.add_flag("--all", fChoice.fAll,
                         "each key that a run did not reach, and gputag lines");
    }

    CommandChoice Choose(const CLI::App& command,
                         const std::vector<std::string>& /*childWords*/) override
    {
        fChoice.fFormat = ReadFormat(fFormat);
        if (command.count("--tolerance") > 0)
            fChoice.fSeriesTolerance = fChoice.fTolerance;
        return fChoice;
    }

private:
    DiffChoice fChoice;
    std::string fFormat = "text";
};

} // namespace

std::unique_ptr<CommandOptions> MakeDiffOptions()
{
    return std::make_unique<DiffOptions>();
}

} // namespace assay_host
