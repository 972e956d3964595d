#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class ShowOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"show", "show a stored report in any form", "show [option...] REPORT",
                "exit status: 0 shown, 10 error"};
    }

    void Add(CLI::App& command) override
    {
        AddText(command, "REPORT", fChoice.fReport, "a report: json, jsonl, or as assay prints it",
                "FILE")
            ->required()
            ->option_text(" ");
        AddWord(command, "--format", fFormat, "[text], json, html, prometheus, nfd, ansible",
                "FORMAT", {"text", "json", "html", "prometheus", "nfd", "ansible"});
        command.add_option("--schema", fChoice.fSchema, "of json, 1 or 2 [2]")
            ->option_text("NUMBER")
            ->check(CLI::IsMember({"1", "2"}));
        AddText(command, "--output", fChoice.fOutput, "write to this file [standard output]",
                "FILE");
    }

    CommandChoice Choose(const CLI::App& command,
                         const std::vector<std::string>& /*childWords*/) override
    {
        fChoice.fFormat = ReadFormat(fFormat);
        if (command.count("--schema") > 0 && fChoice.fFormat != Format::kJson)
            throw CLI::ValidationError("--schema", "only with --format json");
        return fChoice;
    }

private:
    ShowChoice fChoice;
    std::string fFormat = "text";
};

} // namespace

std::unique_ptr<CommandOptions> MakeShowOptions()
{
    return std::make_unique<ShowOptions>();
}

} // namespace assay_host
