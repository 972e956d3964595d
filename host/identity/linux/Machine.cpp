#include "identity/linux/Machine.h"

#include <unistd.h>

#include "facts/FileVersion.h"
#include "facts/OsRelease.h"
#include "identity/linux/Adapters.h"

namespace assay_host {

namespace {

std::string GetSystem(const Files& files)
{
    std::string release = files.Read("/etc/os-release");
    if (release.empty())
        release = files.Read("/usr/lib/os-release");
    std::string text = FindOsRelease(release, "PRETTY_NAME");
    for (const char* name : {"VERSION_ID", "BUILD_ID"})
        text += "; " + FindOsRelease(release, name);
    // The version tells two builds of one release apart.
    for (const char* name : {"osrelease", "version"})
        text += "; " + files.ReadLine(std::string("/proc/sys/kernel/") + name);
    return text;
}

Variables GetEnvironmentVariables()
{
    Variables variables;
    for (char** entry = environ; entry != nullptr && *entry != nullptr; ++entry) {
        const std::string text = *entry;
        const std::size_t end = text.find('=');
        if (end != std::string::npos)
            variables.emplace(text.substr(0, end), text.substr(end + 1));
    }
    return variables;
}

} // namespace

Identity GetMachineIdentity(const Files& files, const Variables&)
{
    Identity identity;
    identity.fAdapters = ListAdapters(files);
    identity.fSystem = GetSystem(files);
    SortIdentity(identity);
    return identity;
}

Identity GetIdentity(const std::string& assayProgram)
{
    Identity identity = GetMachineIdentity(Files(), GetEnvironmentVariables());
    identity.fAssayVersion = GetFileVersion(assayProgram).fValue;
    return identity;
}

} // namespace assay_host
