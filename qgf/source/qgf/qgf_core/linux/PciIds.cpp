// libpciaccess is tried first, since it knows the path of the system's database. A look-up needs no
// pci_system_init, so the bus isn't scanned and no configuration space is read, which would wake a
// suspended card. The library is loaded at run time, so that the program runs without it. The
// database is parsed here if the library is missing or has no name, and for a replaced root, since
// the library's path can't be changed.
#include "qgf/qgf_core/linux/PciIds.h"

#include <memory>

#include <pciaccess.h>

#include "qgf/Core.h"
#include "qgf/SystemFiles.h"

namespace QGF {
namespace {

// Bytes; ten times the size of the database in 2024.
constexpr std::size_t kMaxDatabaseSize = std::size_t{16} << 20;

const char* const kDatabases[] = {"/usr/share/hwdata/pci.ids", "/usr/share/misc/pci.ids"};

using GetStrings = decltype(&pci_get_strings);

GetStrings LoadGetStrings()
{
    static const char* const kNames[] = {"libpciaccess.so.0", nullptr};
    try {
        // Never closed: the library owns the strings that it returns.
        static const Core::DynamicLibrary* const gLibrary = Core::OpenLibrary(kNames).release();
        return reinterpret_cast<GetStrings>(gLibrary->getProc("pci_get_strings"));
    } catch (const LogicalException&) {
        return nullptr;
    }
}

std::string LibraryName(std::uint16_t vendor, std::uint16_t device)
{
    static const GetStrings gGetStrings = LoadGetStrings();
    if (!gGetStrings)
        return std::string();
    pci_id_match match{};
    match.vendor_id = vendor;
    match.device_id = device;
    match.subvendor_id = PCI_MATCH_ANY;
    match.subdevice_id = PCI_MATCH_ANY;
    const char* deviceName = nullptr;
    const char* vendorName = nullptr;
    gGetStrings(&match, &deviceName, &vendorName, nullptr, nullptr);
    if (!deviceName || !vendorName)
        return std::string();
    return std::string(vendorName) + " " + deviceName;
}

} // namespace

std::string PciIds::name(std::uint16_t vendor, std::uint16_t device)
{
    if (SystemRoot().empty()) {
        std::string name = LibraryName(vendor, device);
        if (!name.empty())
            return name;
    }
    if (!fRead) {
        fRead = true;
        for (const char* path : kDatabases)
            if (ReadSystemFile(path, fDatabase, kMaxDatabaseSize))
                break;
    }
    return FindPciName(fDatabase, vendor, device);
}

} // namespace QGF
