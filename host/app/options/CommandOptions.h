// The command-line options of each command. The functions throw CLI::ParseError for words that a
// command doesn't take.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "app/CommandLine.h"

namespace assay_host {

// The options of one command. For one parse.
class CommandOptions {
public:
    // What the help shows.
    struct Help {
        const char* fName;
        const char* fPurpose;
        const char* fUsage;
        const char* fFooter;
    };

    virtual ~CommandOptions() = default;
    CommandOptions() = default;
    CommandOptions(const CommandOptions&) = delete;
    CommandOptions& operator=(const CommandOptions&) = delete;

    virtual Help GetHelp() const = 0;

    // Adds the options to the command, which this object must outlive.
    virtual void Add(CLI::App& command) = 0;

    // Whether words after "--" are the child's.
    virtual bool TakesChildWords() const { return false; }

    // Checks the options against each other and returns what was chosen, after the parse.
    virtual CommandChoice Choose(const CLI::App& command,
                                 const std::vector<std::string>& childWords) = 0;
};

std::unique_ptr<CommandOptions> MakeRunOptions();
std::unique_ptr<CommandOptions> MakeTortureOptions();
std::unique_ptr<CommandOptions> MakeDiffOptions();
std::unique_ptr<CommandOptions> MakeShowOptions();
std::unique_ptr<CommandOptions> MakeBugReportOptions();
std::unique_ptr<CommandOptions> MakeExplainOptions();
std::unique_ptr<CommandOptions> MakeCheckOptions();
std::unique_ptr<CommandOptions> MakeAdviseOptions();
std::unique_ptr<CommandOptions> MakeStateOptions();

// Options that several commands have.
void AddChildOptions(CLI::App& command, ChildChoice& child);
void AddStateFolder(CLI::App& command, std::string& folder);

// Adds an option with a finite number of at least 0.
void AddNumber(CLI::App& command, const char* name, double& number, const char* what,
               const char* unit);

// Adds an option with a text that isn't empty. Returns it.
CLI::Option* AddText(CLI::App& command, const char* name, std::string& text, const char* what,
                     const char* placeholder);

// Adds an option that may be repeated, each time with a text that isn't empty.
void AddTexts(CLI::App& command, const char* name, std::vector<std::string>& texts,
              const char* what, const char* placeholder);

// Adds the last operands of a command: files, at least one if it is required. Returns them.
CLI::Option* AddFiles(CLI::App& command, const char* name, std::vector<std::string>& files,
                      const char* what);

// Adds an option with one of these words.
void AddWord(CLI::App& command, const char* name, std::string& word, const char* what,
             const char* placeholder, const std::vector<std::string>& words);

// Returns the format of "json", "jsonl", "prometheus", "nfd" or "ansible", and of any other text
// the text form.
Format ReadFormat(const std::string& format);

// Returns the need of "opengl", "opencl" or "both", and of any other text nothing.
Need ReadNeed(const std::string& need);

} // namespace assay_host
