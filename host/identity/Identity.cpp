#include "identity/Identity.h"

#include <algorithm>
#include <tuple>

namespace assay_host {

namespace {

auto Fields(const AdapterIdentity& adapter)
{
    return std::tie(adapter.fSlot, adapter.fVendor, adapter.fDevice, adapter.fDriver,
                    adapter.fDriverVersion);
}

auto Fields(const DriverFile& file)
{
    return std::tie(file.fInterface, file.fPath, file.fSize, file.fTime, file.fBuildId);
}

auto Fields(const Identity& identity)
{
    return std::tie(identity.fAdapters, identity.fFiles, identity.fVariables, identity.fSystem,
                    identity.fAssayVersion);
}

template <typename T>
void Sort(std::vector<T>& list)
{
    std::sort(list.begin(), list.end(),
              [](const T& left, const T& right) { return Fields(left) < Fields(right); });
}

} // namespace

bool operator==(const AdapterIdentity& left, const AdapterIdentity& right)
{
    return Fields(left) == Fields(right);
}

bool operator==(const DriverFile& left, const DriverFile& right)
{
    return Fields(left) == Fields(right);
}

bool operator==(const Identity& left, const Identity& right)
{
    return Fields(left) == Fields(right);
}

bool operator!=(const Identity& left, const Identity& right)
{
    return !(left == right);
}

void SortIdentity(Identity& identity)
{
    Sort(identity.fAdapters);
    Sort(identity.fFiles);
    identity.fFiles.erase(std::unique(identity.fFiles.begin(), identity.fFiles.end()),
                          identity.fFiles.end());
}

} // namespace assay_host
