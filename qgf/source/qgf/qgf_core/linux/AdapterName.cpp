// The files that are read here don't wake a suspended card. "class", "vendor" and "device" of a PCI
// device print fields of the kernel's struct pci_dev (drivers/pci/pci-sysfs.c, pci_config_attr;
// Documentation/ABI/testing/sysfs-bus-pci), unlike "config" and the link speeds, which resume the
// device. amdgpu's "product_name" prints a text that the driver has read at its start
// (drivers/gpu/drm/amd/amdgpu/amdgpu_fru_eeprom.c); only server cards have it. "uevent" of a device
// that isn't on PCI prints the device tree's entry (drivers/of/device.c, of_device_uevent) and
// calls no driver. The one file that does wake its card is read in NvidiaProc.cpp.
#include "qgf/AdapterName.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <map>
#include <memory>
#include <set>

#include "qgf/DrmNodes.h"
#include "qgf/qgf_core/linux/NvidiaProc.h"
#include "qgf/qgf_core/linux/PciAddress.h"
#include "qgf/qgf_core/linux/PciIds.h"
#include "qgf/qgf_core/linux/Uevent.h"

namespace QGF {
namespace {

const char kPciDevices[] = "/sys/bus/pci/devices";
constexpr unsigned kDisplayClass = 0x03;
constexpr std::uint16_t kNvidia = 0x10DE;

// An adapter description has 127 characters; the longest " (PCI address)" needs 19 of them.
constexpr std::size_t kMaxNameLength = 127 - 19;

struct Adapters {
    unsigned rootCount = 0;
    std::vector<DrmNode> nodes;
    std::vector<std::string> places;
    std::map<std::string, std::string> names;
};

std::string AttributeOf(const std::string& place, const char* attribute)
{
    return ReadSystemLine(AdapterFolder(place) + attribute);
}

// An id as the kernel prints it, "0x10de"; 0 for any other text.
unsigned long IdOf(const std::string& address, const char* attribute)
{
    const std::string text = AttributeOf(address, attribute);
    char* end = nullptr;
    const unsigned long id = std::strtoul(text.c_str(), &end, 16);
    return !text.empty() && *end == '\0' && id <= 0xFFFFFF ? id : 0;
}

std::uint16_t ShortIdOf(const std::string& address, const char* attribute)
{
    const unsigned long id = IdOf(address, attribute);
    return static_cast<std::uint16_t>(id <= 0xFFFF ? id : 0);
}

// PCI addresses first, then the other places.
std::vector<std::string> FindAdapters(const std::vector<DrmNode>& nodes)
{
    std::set<std::string> onPci;
    std::set<std::string> elsewhere;
    for (const DrmNode& node : nodes)
        (IsPciAddress(node.place) ? onPci : elsewhere).insert(node.place);
    std::vector<std::string> adapters;
    for (const std::string& address : ListSystemFolder(kPciDevices))
        if (IsPciAddress(address) &&
            (onPci.count(address) != 0 || IdOf(address, "class") >> 16 == kDisplayClass))
            adapters.push_back(address);
    adapters.insert(adapters.end(), elsewhere.begin(), elsewhere.end());
    return adapters;
}

std::string HexName(std::uint16_t vendor, std::uint16_t device)
{
    char text[16];
    std::snprintf(text, sizeof text, "%04x:%04x", unsigned{vendor}, unsigned{device});
    return text;
}

// Replaces the characters that the adapter lists would escape, and truncates the name.
std::string Plain(const std::string& name)
{
    std::string plain;
    for (const char c : name) {
        if (static_cast<unsigned char>(c) >= 0x80 && static_cast<unsigned char>(c) < 0xC0)
            continue; // a UTF-8 continuation byte: the lead byte has become '?'
        if (c == '"')
            plain += '\'';
        else if (c == '\\')
            plain += '/';
        else
            plain += c >= ' ' && c <= '~' ? c : '?';
    }
    plain.resize(std::min(plain.size(), kMaxNameLength));
    return plain;
}

std::string PciNameOf(const std::string& address, PciIds& ids)
{
    const std::uint16_t vendor = ShortIdOf(address, "vendor");
    const std::uint16_t device = ShortIdOf(address, "device");
    std::string name;
    if (vendor == kNvidia)
        name = Plain(NvidiaModel(address));
    if (name.empty())
        name = Plain(AttributeOf(address, "product_name"));
    if (name.empty())
        name = Plain(ids.name(vendor, device));
    return name.empty() ? HexName(vendor, device) : name;
}

// The device tree's "compatible" text, else the driver's name, else the device's folder.
std::string DeviceNameOf(const std::string& place)
{
    std::string uevent;
    ReadSystemFile(AdapterFolder(place) + "uevent", uevent);
    std::string name = Plain(UeventValue(uevent, "OF_COMPATIBLE_0"));
    if (name.empty())
        name = Plain(LastOfPath(ReadSystemLink(AdapterFolder(place) + "driver")));
    return name.empty() ? Plain(LastOfPath(place)) : name;
}

Adapters ReadAdapters()
{
    Adapters adapters;
    adapters.rootCount = SystemRootCount();
    adapters.nodes = DrmNodes();
    adapters.places = FindAdapters(adapters.nodes);
    PciIds ids;
    std::map<std::string, int> uses;
    for (const std::string& place : adapters.places) {
        const std::string name = IsPciAddress(place) ? PciNameOf(place, ids) : DeviceNameOf(place);
        adapters.names[place] = name;
        ++uses[name];
    }
    int elsewhere = 0;
    for (auto& [place, name] : adapters.names)
        if (uses[name] > 1)
            name += " (" + (IsPciAddress(place) ? place : std::to_string(++elsewhere)) + ")";
    return adapters;
}

const Adapters& GetAdapters()
{
    static std::unique_ptr<Adapters> gKnown;
    if (!gKnown || gKnown->rootCount != SystemRootCount())
        gKnown = std::make_unique<Adapters>(ReadAdapters());
    return *gKnown;
}

// Moves a card's address from the list of free cards to a device.
void Assign(std::vector<std::string>& cards, std::vector<std::string>::iterator card,
            std::string& address)
{
    address = *card;
    cards.erase(card);
}

} // namespace

const std::vector<std::string>& DisplayAdapters()
{
    return GetAdapters().places;
}

const std::vector<DrmNode>& DisplayNodes()
{
    return GetAdapters().nodes;
}

std::string AdapterName(const std::string& place)
{
    const Adapters& adapters = GetAdapters();
    const auto entry = adapters.names.find(place);
    return entry == adapters.names.end() ? std::string() : entry->second;
}

std::vector<std::string> NvidiaAdapters(const std::vector<std::string>& names,
                                        const std::vector<std::string>& taken)
{
    std::vector<std::string> addresses(names.size());
    const auto isTaken = [&](const std::string& address) {
        return std::find(taken.begin(), taken.end(), address) != taken.end();
    };
    std::vector<std::string> cards = NvidiaCards();
    const bool listed = !cards.empty();
    if (!listed) {
        for (const std::string& address : DisplayAdapters())
            if (ShortIdOf(address, "vendor") == kNvidia)
                cards.push_back(address);
    }
    cards.erase(std::remove_if(cards.begin(), cards.end(), isTaken), cards.end());
    if (!listed) {
        if (names.size() == 1 && cards.size() == 1)
            addresses[0] = cards[0];
        return addresses;
    }

    std::map<std::string, std::string> models;
    for (const std::string& card : cards)
        models[card] = NvidiaModel(card);
    std::vector<std::string*> unassigned;
    for (std::size_t i = 0; i != names.size(); ++i) {
        const auto card = std::find_if(cards.begin(), cards.end(), [&](const std::string& address) {
            return !names[i].empty() && models[address] == names[i];
        });
        if (card == cards.end())
            unassigned.push_back(&addresses[i]);
        else
            Assign(cards, card, addresses[i]);
    }
    if (unassigned.size() == cards.size())
        for (std::string* address : unassigned)
            Assign(cards, cards.begin(), *address);
    return addresses;
}

} // namespace QGF
