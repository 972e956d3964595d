#include "app/options/CommandOptions.h"

namespace assay_host {

namespace {

class RunOptions : public CommandOptions {
public:
    Help GetHelp() const override
    {
        return {"run", "run assay and show its report", "run [option...] [-- child option...]",
                "exit status: 0 complete, 1 failed tests, 2 usage error of the child,\n"
                "  3 crashed, 4 hung and killed, 5 never started, 6 interrupted,\n"
                "  10 error in the command line or the output;\n"
                "  with --need: 0 hardware, 20 software, 21 broken, 22 absent, 23 unknown;\n"
                "  with --repeat or --for: that of the worst run"};
    }

    void Add(CLI::App& command) override
    {
        AddChildOptions(command, fChoice.fChild);
        AddWord(command, "--format", fFormat, "[text], json, jsonl, html, prometheus, nfd, ansible",
                "FORMAT", {"text", "json", "jsonl", "html", "prometheus", "nfd", "ansible"});
        command.add_option("--schema", fChoice.fSchema, "of json and jsonl, 1 or 2 [2]")
            ->option_text("NUMBER")
            ->check(CLI::IsMember({"1", "2"}));
        AddWord(command, "--need", fNeed, "opengl, opencl or both: exit by whether they work",
                "WHAT", {"opengl", "opencl", "both"});
        command.add_flag("--identify", fChoice.fIdentify,
                         "name this machine in json, jsonl and html");
        command.add_option("--repeat", fChoice.fSeries.fRuns, "run the child so often")
            ->option_text("NUMBER")
            ->check(CLI::Range(std::size_t{1}, kMaxSeriesSamples));
        AddNumber(command, "--for", fChoice.fSeries.fSeconds,
                  "start further runs until this time has passed", "SECONDS");
        command.add_flag("--raw", fChoice.fRaw,
                         "print the child's own lines first; only with text");
        AddText(command, "--output", fChoice.fOutput, "write to this file [standard output]",
                "FILE");
    }

    bool TakesChildWords() const override { return true; }

    CommandChoice Choose(const CLI::App& command,
                         const std::vector<std::string>& childWords) override
    {
        fChoice.fFormat = ReadFormat(fFormat);
        const bool isJson =
            fChoice.fFormat == Format::kJson || fChoice.fFormat == Format::kJsonLines;
        if (fChoice.fRaw && fChoice.fFormat != Format::kText)
            throw CLI::ValidationError("--raw", "only with --format text");
        if (command.count("--schema") > 0 && !isJson)
            throw CLI::ValidationError("--schema", "only with --format json or jsonl");
        CheckIdentify();
        CheckSeries(command);
        fChoice.fNeed = ReadNeed(fNeed);
        fChoice.fChild.fArgs = childWords;
        return fChoice;
    }

private:
    void CheckIdentify() const
    {
        if (!fChoice.fIdentify)
            return;
        if (fChoice.fFormat != Format::kJson && fChoice.fFormat != Format::kJsonLines &&
            fChoice.fFormat != Format::kHtml)
            throw CLI::ValidationError("--identify", "only with --format json, jsonl or html");
        if (fChoice.fSchema == 1)
            throw CLI::ValidationError("--identify", "not with --schema 1, which names no machine");
    }

    void CheckSeries(const CLI::App& command) const
    {
        const char* const option = command.count("--repeat") > 0 ? "--repeat"
                                   : command.count("--for") > 0  ? "--for"
                                                                 : nullptr;
        if (option == nullptr)
            return;
        if (!fChoice.fSeries.IsAsked())
            throw CLI::ValidationError(option, "must be more than 0");
        if (fChoice.fFormat == Format::kJsonLines)
            throw CLI::ValidationError(option, "not with --format jsonl, which has one run");
        if (fChoice.fSchema == 1)
            throw CLI::ValidationError(option, "not with --schema 1, which has one run");
    }

    RunChoice fChoice;
    std::string fFormat = "text";
    std::string fNeed;
};

} // namespace

std::unique_ptr<CommandOptions> MakeRunOptions()
{
    return std::make_unique<RunOptions>();
}

} // namespace assay_host
