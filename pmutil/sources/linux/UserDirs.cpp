#include "linux/UserDirs.h"

#include <algorithm>
#include <istream>
#include <string_view>

namespace pmutil {

namespace {

constexpr std::string_view kBlanks = " \t";
constexpr std::string_view kKey = "XDG_DESKTOP_DIR";
constexpr std::string_view kHome = "$HOME";

void SkipBlanks(std::string_view& text)
{
    text.remove_prefix(std::min(text.find_first_not_of(kBlanks), text.size()));
}

bool Skip(std::string_view& text, std::string_view expected)
{
    if (text.substr(0, expected.size()) != expected)
        return false;
    text.remove_prefix(expected.size());
    return true;
}

// Returns the path after the opening quote; empty if the line is malformed.
std::string ReadPath(std::string_view text, const std::string& home)
{
    std::string path;
    if (Skip(text, kHome)) {
        if (text.empty() || (text.front() != '/' && text.front() != '"'))
            return {};
        path = home;
    } else if (text.empty() || text.front() != '/') {
        return {};
    }
    for (; !text.empty() && text.front() != '"'; text.remove_prefix(1)) {
        if (text.front() == '\\' && text.size() > 1)
            text.remove_prefix(1);
        path += text.front();
    }
    return path;
}

} // namespace

std::string FindDesktopDir(std::istream& userDirs, const std::string& home)
{
    std::string found;
    for (std::string line; std::getline(userDirs, line);) {
        std::string_view rest = line;
        SkipBlanks(rest);
        if (!Skip(rest, kKey))
            continue;
        SkipBlanks(rest);
        if (!Skip(rest, "="))
            continue;
        SkipBlanks(rest);
        if (!Skip(rest, "\""))
            continue;
        std::string path = ReadPath(rest, home);
        if (!path.empty())
            found = std::move(path);
    }
    return found;
}

} // namespace pmutil
