#include "identity/linux/Process.h"

#include <algorithm>
#include <filesystem>
#include <system_error>

#include <sys/auxv.h>
#include <unistd.h>

namespace assay_host {

std::string Process::Get(const std::string& name) const
{
    const auto variable = fVariables.find(name);
    return variable == fVariables.end() ? std::string() : variable->second;
}

std::string Process::MakeAbsolute(const std::string& path) const
{
    return path.empty() || path.front() == '/' ? path : fFolder + "/" + path;
}

Process GetThisProcess()
{
    Process process;
    std::error_code failure;
    process.fFolder = std::filesystem::current_path(failure).string();
    const bool isPlain = ::getauxval(AT_SECURE) == 0;
    for (char** entry = environ; isPlain && entry != nullptr && *entry != nullptr; ++entry) {
        const std::string text = *entry;
        const std::size_t end = text.find('=');
        if (end != std::string::npos)
            process.fVariables.emplace(text.substr(0, end), text.substr(end + 1));
    }
    return process;
}

std::vector<std::string> SplitPaths(const std::string& list, char separator)
{
    std::vector<std::string> paths;
    std::size_t begin = 0;
    while (begin < list.size()) {
        const std::size_t end = std::min(list.find(separator, begin), list.size());
        if (end != begin)
            paths.push_back(list.substr(begin, end - begin));
        begin = end + 1;
    }
    return paths;
}

} // namespace assay_host
