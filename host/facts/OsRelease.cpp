#include "facts/OsRelease.h"

#include <fstream>
#include <iterator>

namespace assay_host {

namespace {

std::string Unquote(std::string_view word)
{
    const bool isQuoted = word.size() >= 2 && (word.front() == '"' || word.front() == '\'') &&
                          word.back() == word.front();
    const bool isLiteral = isQuoted && word.front() == '\'';
    if (isQuoted)
        word = word.substr(1, word.size() - 2);
    std::string value;
    for (std::size_t index = 0; index < word.size(); ++index) {
        if (word[index] == '\\' && !isLiteral && index + 1 < word.size())
            ++index;
        value += word[index];
    }
    return value;
}

} // namespace

std::string FindOsRelease(std::string_view text, std::string_view name)
{
    std::string value;
    while (!text.empty()) {
        const std::size_t end = text.find('\n');
        std::string_view line = text.substr(0, end);
        text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
        if (line.substr(0, name.size()) == name && line.substr(name.size(), 1) == "=") {
            line.remove_prefix(name.size() + 1);
            value = Unquote(line.substr(0, line.find_last_not_of(" \t\r") + 1));
        }
    }
    return value;
}

std::string FindOsBuild(std::string_view text)
{
    const std::string build = FindOsRelease(text, "BUILD_ID");
    return build.empty() ? FindOsRelease(text, "VERSION_ID") : build;
}

std::string ReadOsRelease(const std::string& root)
{
    for (const char* path : {"/etc/os-release", "/usr/lib/os-release"}) {
        std::ifstream file(root + path, std::ios::binary);
        if (file)
            return {std::istreambuf_iterator<char>(file), {}};
    }
    return {};
}

} // namespace assay_host
