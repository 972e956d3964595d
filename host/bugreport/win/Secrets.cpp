#include <windows.h>

#include <string>
#include <vector>

#include <boost/nowide/convert.hpp>
#include <boost/nowide/cstdlib.hpp>

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

std::string GetVariable(const char* name)
{
    const char* const value = boost::nowide::getenv(name);
    return value ? value : "";
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
    secrets.push_back({GetVariable("COMPUTERNAME"), "HOST"});
    secrets.push_back({GetUserText(), "USER"});
    secrets.push_back({GetVariable("USERNAME"), "USER"});
    secrets.push_back({GetVariable("USERPROFILE"), "HOME"});
    return secrets;
}

} // namespace assay_host
