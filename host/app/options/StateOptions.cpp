#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class StateOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"state", "show or change what advise remembers",
                "state list|show|forget|set --state FOLDER [WORD...]",
                "list: the entries, one for each state of the machine\n"
                "show [ENTRY...]: all that is known\n"
                "forget [ENTRY...]: without an entry, everything\n"
                "set opengl=VALUE opencl=VALUE: hardware, software, absent, auto\n"
                "exit status: 0 done, 10 error"};
    }

    void Add(CLI::App& command) override
    {
        command.add_option("ACTION", fAction, "list, show, forget or set")
            ->required()
            ->option_text(" ")
            ->check(CLI::IsMember({"list", "show", "forget", "set"}));
        command.add_option("WORD", fChoice.fWords, "what to act on")->option_text(" ");
        AddStateFolder(command, fChoice.fState);
    }

    CommandChoice Choose(const CLI::App& /*command*/,
                         const std::vector<std::string>& /*childWords*/) override
    {
        fChoice.fAction = fAction == "show"     ? StateAction::kShow
                          : fAction == "forget" ? StateAction::kForget
                          : fAction == "set"    ? StateAction::kSet
                                                : StateAction::kList;
        if (fChoice.fAction == StateAction::kList && !fChoice.fWords.empty())
            throw CLI::ExtrasError(fChoice.fWords);
        if (fChoice.fAction == StateAction::kSet && fChoice.fWords.empty())
            throw CLI::ValidationError("set", "opengl=VALUE or opencl=VALUE is missing");
        return fChoice;
    }

private:
    StateChoice fChoice;
    std::string fAction;
};

} // namespace

std::unique_ptr<CommandOptions> MakeStateOptions()
{
    return std::make_unique<StateOptions>();
}

} // namespace assay_host
