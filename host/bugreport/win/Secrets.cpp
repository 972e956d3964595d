#include <windows.h>

#include <string>
#include <vector>

#include <boost/nowide/convert.hpp>

#include "bugreport/Mask.h"

namespace assay_host {

namespace {

std::string GetComputerName(COMPUTER_NAME_FORMAT format)
{
    wchar_t name[256] = {};
    DWORD size = 256;
    return ::GetComputerNameExW(format, name, &size) != 0 ? boost::nowide::narrow(name)
                                                          : std::string();
}

// Returns the value of a variable; empty if it isn't set.
std::string GetVariable(const wchar_t* name)
{
    std::wstring value(::GetEnvironmentVariableW(name, nullptr, 0), L'\0');
    value.resize(::GetEnvironmentVariableW(name, value.data(), static_cast<DWORD>(value.size())));
    return boost::nowide::narrow(value);
}

std::string GetUserText()
{
    wchar_t name[257] = {};
    DWORD size = 257;
    return ::GetUserNameW(name, &size) != 0 ? boost::nowide::narrow(name) : std::string();
}

} // namespace

std::vector<Secret> ListSecrets()
{
    std::vector<Secret> secrets;
    for (const COMPUTER_NAME_FORMAT format :
         {ComputerNamePhysicalDnsFullyQualified, ComputerNamePhysicalDnsHostname,
          ComputerNamePhysicalNetBIOS})
        secrets.push_back({GetComputerName(format), "HOST"});
    secrets.push_back({GetVariable(L"COMPUTERNAME"), "HOST"});
    secrets.push_back({GetUserText(), "USER"});
    secrets.push_back({GetVariable(L"USERNAME"), "USER"});
    secrets.push_back({GetVariable(L"USERPROFILE"), "HOME"});
    return secrets;
}

} // namespace assay_host
