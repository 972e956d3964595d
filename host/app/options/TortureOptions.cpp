#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class TortureOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"torture", "make assay fail at every step and check each outcome",
                "torture [option...] [-- child option...]",
                "exit status: 0 as predicted, 1 different, 5 never started, 6 interrupted,\n"
                "  10 error in the command line or the output"};
    }

    void Add(CLI::App& command) override
    {
        AddChildOptions(command, fChoice.fChild);
        AddWord(command, "--kind", fKind, "crash, throw or both [both]", "KIND",
                {"crash", "throw", "both"});
    }

    bool TakesChildWords() const override { return true; }

    CommandChoice Choose(const CLI::App& /*command*/,
                         const std::vector<std::string>& childWords) override
    {
        fChoice.fChild.fArgs = childWords;
        for (const std::string& word : childWords)
            if (word.rfind("-crashAfter=", 0) == 0 || word.rfind("-throwAfter=", 0) == 0)
                throw CLI::ValidationError(word, "torture sets this itself");
        if (fKind != "throw")
            fChoice.fFailures.push_back(StepFailure::kCrash);
        if (fKind != "crash")
            fChoice.fFailures.push_back(StepFailure::kThrow);
        return fChoice;
    }

private:
    TortureChoice fChoice;
    std::string fKind = "both";
};

} // namespace

std::unique_ptr<CommandOptions> MakeTortureOptions()
{
    return std::make_unique<TortureOptions>();
}

} // namespace assay_host
