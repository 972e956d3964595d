#include "app/options/CommandOptions.h"

#include <cmath>

namespace assay_host {

namespace {

std::string CheckNumber(const std::string& text)
{
    double value = 0;
    if (!CLI::detail::lexical_cast(text, value) || !std::isfinite(value) || value < 0)
        return '"' + text + "\" is not a number of at least 0";
    return {};
}

std::string CheckNotEmpty(const std::string& text)
{
    return text.empty() ? "must not be empty" : "";
}

} // namespace

void AddChildOptions(CLI::App& command, ChildChoice& child)
{
    AddText(command, "--assay", child.fProgram,
            "program to run [beside assay-host, or on the PATH]", "PATH");
    AddNumber(command, "--timeout", child.fTimeoutSeconds,
              "kill the child after this time, 0: never [60]", "SECONDS");
}

void AddStateFolder(CLI::App& command, std::string& folder)
{
    AddText(command, "--state", folder, "folder of what is remembered", "FOLDER")->required();
}

void AddNumber(CLI::App& command, const char* name, double& number, const char* what,
               const char* unit)
{
    command.add_option(name, number, what)
        ->option_text(unit)
        ->check(CLI::Validator(CheckNumber, unit));
}

CLI::Option* AddText(CLI::App& command, const char* name, std::string& text, const char* what,
                     const char* placeholder)
{
    return command.add_option(name, text, what)
        ->option_text(placeholder)
        ->check(CLI::Validator(CheckNotEmpty, placeholder));
}

void AddTexts(CLI::App& command, const char* name, std::vector<std::string>& texts,
              const char* what, const char* placeholder)
{
    command.add_option(name, texts, what)
        ->option_text(placeholder)
        ->type_size(1)
        ->expected(1)
        ->allow_extra_args(false)
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeAll)
        ->check(CLI::Validator(CheckNotEmpty, placeholder));
}

CLI::Option* AddFiles(CLI::App& command, const char* name, std::vector<std::string>& files,
                      const char* what)
{
    return command.add_option(name, files, what)
        ->option_text(" ")
        ->check(CLI::Validator(CheckNotEmpty, "FILE"));
}

void AddWord(CLI::App& command, const char* name, std::string& word, const char* what,
             const char* placeholder, const std::vector<std::string>& words)
{
    command.add_option(name, word, what)->option_text(placeholder)->check(CLI::IsMember(words));
}

Format ReadFormat(const std::string& format)
{
    return format == "json"         ? Format::kJson
           : format == "jsonl"      ? Format::kJsonLines
           : format == "html"       ? Format::kHtml
           : format == "prometheus" ? Format::kPrometheus
           : format == "nfd"        ? Format::kNodeFeatures
           : format == "ansible"    ? Format::kAnsible
                                    : Format::kText;
}

Need ReadNeed(const std::string& need)
{
    return need == "opengl"   ? Need::kOpenGL
           : need == "opencl" ? Need::kOpenCL
           : need == "both"   ? Need::kBoth
                              : Need::kNothing;
}

} // namespace assay_host
