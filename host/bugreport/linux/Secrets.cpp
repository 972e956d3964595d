#include <array>
#include <cstdlib>
#include <vector>

#include <pwd.h>
#include <unistd.h>

#include "bugreport/Mask.h"

namespace assay_host {

namespace {

void AddHost(std::vector<Secret>& secrets)
{
    std::array<char, 256> name{};
    if (::gethostname(name.data(), name.size() - 1) != 0)
        return;
    const std::string whole = name.data();
    secrets.push_back({whole, "HOST"});
    secrets.push_back({whole.substr(0, whole.find('.')), "HOST"});
}

void AddEntry(std::vector<Secret>& secrets, const ::passwd* entry)
{
    if (!entry)
        return;
    secrets.push_back({entry->pw_name, "USER"});
    secrets.push_back({entry->pw_dir, "HOME"});
    const std::string more = entry->pw_gecos ? entry->pw_gecos : "";
    secrets.push_back({more.substr(0, more.find(',')), "USER"}); // the person's name
}

} // namespace

std::vector<Secret> ListSecrets()
{
    std::vector<Secret> secrets;
    AddHost(secrets);
    const auto getVariable = [](const char* name) {
        const char* const value = std::getenv(name); // NOLINT(concurrency-mt-unsafe)
        return std::string(value ? value : "");
    };
    secrets.push_back({getVariable("HOME"), "HOME"});
    for (const char* const variable : {"USER", "LOGNAME", "SUDO_USER"}) {
        const std::string name = getVariable(variable);
        secrets.push_back({name, "USER"});
        if (!name.empty())
            AddEntry(secrets, ::getpwnam(name.c_str())); // NOLINT(concurrency-mt-unsafe)
    }
    AddEntry(secrets, ::getpwuid(::getuid())); // NOLINT(concurrency-mt-unsafe)
    return secrets;
}

} // namespace assay_host
