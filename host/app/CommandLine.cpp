#include "app/CommandLine.h"

#include <algorithm>
#include <map>
#include <memory>
#include <sstream>
#include <utility>

#include <CLI/CLI.hpp>
#include <boost/algorithm/string/replace.hpp>
#include <fmt/format.h>

#include "app/options/CommandOptions.h"
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

    // The group of a hidden option leaves an empty line.
    std::string make_help(const CLI::App* app, std::string name,
                          CLI::AppFormatMode mode) const override
    {
        return boost::algorithm::replace_all_copy(
            CLI::Formatter::make_help(app, std::move(name), mode), "\n\n\n", "\n\n");
    }

private:
    std::map<std::string, std::string> fUsages;
};

constexpr const char* kVersion = "assay-host " ASSAY_VERSION;

class Parser {
public:
    // Only the commands that a word names get their options, since all of them would take longer
    // than an answer from memory.
    explicit Parser(const std::vector<std::string>& words) : fWords(Split(words))
    {
        fApp.name("assay-host");
        fApp.formatter(fFormatter);
        fApp.set_help_flag("-h,--help", "show this text");
        fApp.set_version_flag("--version", kVersion, "show the version");
        // On Windows too a word that begins with a slash is a path.
        fApp.allow_windows_style_options(false);
        fApp.require_subcommand(1);
        fApp.footer("\"assay-host COMMAND --help\" describes a command.");
        for (const auto& make : {MakeRunOptions, MakeTortureOptions, MakeDiffOptions,
                                 MakeShowOptions, MakeExplainOptions, MakeCheckOptions,
                                 MakeAdviseOptions, MakeStateOptions, MakeBugReportOptions}) {
            std::unique_ptr<CommandOptions> options = make();
            const CommandOptions::Help help = options->GetHelp();
            CLI::App* const command = fApp.add_subcommand(help.fName, help.fPurpose);
            fFormatter->AddUsage(help.fName, help.fUsage);
            command->footer(help.fFooter);
            command->set_version_flag("--version", kVersion)->group(""); // not in its help
            if (std::find(fWords.fOwn.begin(), fWords.fOwn.end(), help.fName) != fWords.fOwn.end())
                options->Add(*command);
            fCommands.push_back({command, std::move(options)});
        }
        fFormatter->AddUsage("assay-host", "COMMAND [option...]");
    }

    Parsed Parse()
    {
        try {
            std::vector<std::string> own(fWords.fOwn.rbegin(), fWords.fOwn.rend());
            fApp.parse(own);
            return {Choose(), 0, {}};
        } catch (const CLI::ParseError& error) {
            std::ostringstream out;
            std::ostringstream err;
            if (fApp.exit(error, out, err) == 0)
                return {std::nullopt, 0, out.str()};
            const bool isDiff = !fWords.fOwn.empty() && fWords.fOwn.front() == "diff";
            return {std::nullopt, isDiff ? kDiffErrorStatus : kErrorStatus, GetText(error)};
        }
    }

private:
    struct Command {
        CLI::App* fApp; // owned by the parser's
        std::unique_ptr<CommandOptions> fOptions;
    };

    static std::string GetText(const CLI::ParseError& error)
    {
        return fmt::format("assay-host: {}\nRun \"assay-host --help\" for the usage.\n",
                           ShowBytes(error.what()));
    }

    CommandChoice Choose() const
    {
        const auto command = std::find_if(fCommands.begin(), fCommands.end(),
                                          [](const Command& each) { return each.fApp->parsed(); });
        if (fWords.fHasChild && !command->fOptions->TakesChildWords())
            throw CLI::ExtrasError({kChildWord});
        return command->fOptions->Choose(*command->fApp, fWords.fChild);
    }

    const Words fWords;
    CLI::App fApp{"Runs assay as a child process, survives its failures, and shows its report."};
    const std::shared_ptr<HelpFormatter> fFormatter = std::make_shared<HelpFormatter>();
    std::vector<Command> fCommands;
};

} // namespace

Parsed ParseCommandLine(const std::vector<std::string>& words)
{
    return Parser(words).Parse();
}

} // namespace assay_host
