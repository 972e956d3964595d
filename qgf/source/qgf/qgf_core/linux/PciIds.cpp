// Why two ways. libpciaccess is asked first: it knows where this system keeps its database. Looking
// a name up in it needs no pci_system_init, so that the bus is never scanned and no configuration
// space, whose reading would wake a suspended card, is touched. It is loaded at run time, because a
// machine without it should lose names at most, not the program. But the place of its database is
// compiled into it: it can't be pointed at a replaced root. So the database's text is also read
// directly, which then serves where the library is missing as well.
#include "qgf/qgf_core/linux/PciIds.h"

#include <memory>

#include <pciaccess.h>

#include "qgf/Core.h"
#include "qgf/SystemFiles.h"

namespace QGF {
namespace {

constexpr std::size_t kDatabaseLimit = std::size_t{16} << 20; // bytes; ten times today's

const char* const kDatabases[] = {"/usr/share/hwdata/pci.ids", "/usr/share/misc/pci.ids"};

using GetStrings = decltype(&pci_get_strings);

GetStrings LoadGetStrings()
{
    static const char* const kNames[] = {"libpciaccess.so.0", nullptr};
    try {
        // Never closed: the library keeps the strings that it has given.
        static const Core::DynamicLibrary* const gLibrary = Core::OpenLibrary(kNames).release();
        return reinterpret_cast<GetStrings>(gLibrary->getProc("pci_get_strings"));
    } catch (const LogicalException&) {
        return nullptr;
    }
}

std::string AskLibrary(std::uint16_t vendor, std::uint16_t device)
{
    static const GetStrings gGetStrings = LoadGetStrings();
    if (!gGetStrings) {
        return std::string();
    }
    pci_id_match match{};
    match.vendor_id = vendor;
    match.device_id = device;
    match.subvendor_id = PCI_MATCH_ANY;
    match.subdevice_id = PCI_MATCH_ANY;
    const char* deviceName = nullptr;
    const char* vendorName = nullptr;
    gGetStrings(&match, &deviceName, &vendorName, nullptr, nullptr);
    if (!deviceName || !vendorName) {
        return std::string();
    }
    return std::string(vendorName) + " " + deviceName;
}

} // namespace

std::string PciIds::name(std::uint16_t vendor, std::uint16_t device)
{
    if (SystemRoot().empty()) {
        std::string name = AskLibrary(vendor, device);
        if (!name.empty()) {
            return name;
        }
    }
    if (!fRead) {
        fRead = true;
        for (const char* path : kDatabases) {
            if (ReadSystemFile(path, fDatabase, kDatabaseLimit)) {
                break;
            }
        }
    }
    return FindPciName(fDatabase, vendor, device);
}

} // namespace QGF
