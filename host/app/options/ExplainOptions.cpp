#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class ExplainOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"explain", "explain the keys of a report", "explain [KEY...]",
                "Without a key: lists all.\n"
                "exit status: 0 explained, 10 error"};
    }

    void Add(CLI::App& command) override
    {
        command.add_option("KEY", fChoice.fKeys, "a key of the report, or its label")
            ->option_text(" ");
    }

    CommandChoice Choose(const CLI::App& /*command*/,
                         const std::vector<std::string>& /*childWords*/) override
    {
        return fChoice;
    }

private:
    ExplainChoice fChoice;
};

} // namespace

std::unique_ptr<CommandOptions> MakeExplainOptions()
{
    return std::make_unique<ExplainOptions>();
}

} // namespace assay_host
