#include "facts/Environment.h"

#include <ctime>
#include <string>

#include <sys/utsname.h>

#include "facts/OsRelease.h"
#include "facts/TimeText.h"

namespace assay_host {

namespace {

Fact MakeFact(std::string value, const char* reason)
{
    if (value.empty())
        return {{}, reason};
    return {std::move(value), {}};
}

void SetTime(Environment& environment)
{
    const std::time_t now = std::time(nullptr);
    environment.fTime = MakeUtcText(now);
    std::tm local{};
    const bool isKnown = ::localtime_r(&now, &local) != nullptr;
    environment.fOffset = MakeOffsetText(isKnown ? static_cast<int>(local.tm_gmtoff / 60) : 0);
}

} // namespace

Environment GetEnvironment(bool identify)
{
    Environment environment;
    SetTime(environment);
    const std::string release = ReadOsRelease({});
    environment.fSystem = MakeFact(FindOsRelease(release, "PRETTY_NAME"), "no os-release names it");
    environment.fBuild = MakeFact(FindOsBuild(release), "no os-release has it");
    ::utsname names{};
    const bool hasNames = ::uname(&names) == 0;
    constexpr const char* kNoNames = "the kernel does not tell";
    environment.fKernel = MakeFact(
        hasNames ? std::string(names.sysname) + " " + names.release + " " + names.version : "",
        kNoNames);
    environment.fArchitecture = MakeFact(hasNames ? names.machine : "", kNoNames);
    environment.fHost = identify ? MakeFact(hasNames ? names.nodename : "", kNoNames)
                                 : Fact{{}, "only with --identify"};
    return environment;
}

} // namespace assay_host
