#include "identity/linux/Machine.h"

#include <optional>

#include "facts/FileVersion.h"
#include "facts/OsRelease.h"
#include "identity/Variables.h"
#include "identity/linux/Adapters.h"
#include "identity/linux/DriverFiles.h"

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

} // namespace

Identity GetMachineIdentity(const Files& files, const Process& process)
{
    Identity identity;
    identity.fAdapters = ListAdapters(files);
    identity.fFiles = ListDriverFiles(files, process);
    identity.fVariables = ListVariables([&](const std::string& name) {
        const auto variable = process.fVariables.find(name);
        return variable == process.fVariables.end() ? std::nullopt
                                                    : std::optional(variable->second);
    });
    identity.fSystem = GetSystem(files);
    SortIdentity(identity);
    return identity;
}

Identity GetIdentity(const std::string& assayProgram)
{
    Process process = GetThisProcess();
    process.fProgram = process.MakeAbsolute(assayProgram);
    Identity identity = GetMachineIdentity(Files(), process);
    identity.fAssayVersion = GetFileVersion(assayProgram).fValue;
    return identity;
}

} // namespace assay_host
