#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

#include "MachineTree.h"
#include "identity/linux/Adapters.h"
#include "identity/linux/Machine.h"
#include "support/AdapterTree.h"

namespace assay_host {
namespace {

Identity Read(const AdapterTree& tree)
{
    return GetMachineIdentity(Files(tree.root()), {});
}

std::string Print(const std::vector<AdapterIdentity>& adapters)
{
    std::ostringstream text;
    for (const AdapterIdentity& adapter : adapters)
        text << adapter.fSlot << " " << std::hex << adapter.fVendor << ":" << adapter.fDevice
             << std::dec << " " << adapter.fDriver << " " << adapter.fDriverVersion << "\n";
    return text.str();
}

std::string PrintAdapters(const std::string& tree)
{
    return Print(Read(AdapterTree(tree)).fAdapters);
}

using Device = std::tuple<unsigned, unsigned, std::string>;

// Returns the ids and drivers of the devices that a recorded machine's expected.txt lists.
std::vector<Device> ReadExpected(const std::string& tree)
{
    std::vector<Device> devices;
    std::istringstream lines(ReadAdapterData(tree, "expected.txt"));
    unsigned vendor = 0;
    unsigned device = 0;
    for (std::string line; std::getline(lines, line);) {
        if (std::sscanf(line.c_str(), "vendor=%x device=%x", &vendor, &device) == 2)
            continue;
        static const std::string gKey = "driver=";
        if (line.compare(0, gKey.size(), gKey) == 0)
            devices.emplace_back(vendor, device,
                                 line.substr(gKey.size(), line.find(' ') - gKey.size()));
    }
    return devices;
}

TEST(IdentityAdapters, HaveEveryDeviceOfEveryRecordedMachine)
{
    std::size_t count = 0;
    for (const std::string& name : AdapterTreeNames()) {
        const std::vector<AdapterIdentity> adapters = Read(AdapterTree(name)).fAdapters;
        for (const Device& device : ReadExpected(name)) {
            ++count;
            EXPECT_TRUE(std::any_of(adapters.begin(), adapters.end(),
                                    [&](const AdapterIdentity& adapter) {
                                        return Device(adapter.fVendor, adapter.fDevice,
                                                      adapter.fDriver) == device;
                                    }))
                << name << " lacks " << std::get<2>(device) << "\n"
                << Print(adapters);
        }
    }
    EXPECT_GT(count, 40U);
}

TEST(IdentityAdapters, HaveSlotsIdsAndDrivers)
{
    EXPECT_EQ(PrintAdapters("hybrid-laptop"), "0000:00:02.0 8086:a7a0 i915 \n"
                                              "0000:01:00.0 10de:25a0 nvidia 550.54.15\n");
    EXPECT_EQ(PrintAdapters("amd-two"), "0000:03:00.0 1002:744c amdgpu \n"
                                        "0000:07:00.0 1002:744c amdgpu \n");
    EXPECT_EQ(PrintAdapters("virtio-gpu"), "0000:00:01.0 1af4:1050 virtio_gpu \n");
    EXPECT_EQ(PrintAdapters("software-nodes"), "");
    EXPECT_EQ(PrintAdapters("empty"), "");
}

TEST(IdentityAdapters, HaveTheVersionThatNvidiaKeepsElsewhere)
{
    EXPECT_EQ(PrintAdapters("nvidia-no-drm"),
              "0000:65:00.0 10de:20b5 nvidia NVRM version: NVIDIA UNIX Open Kernel Module for "
              "x86_64  550.54.15  Release Build  (user@host)  Tue Mar  5 22:15:33 UTC 2024\n");
}

TEST(IdentityAdapters, AreAlsoThoseThatAreNotOnPci)
{
    EXPECT_EQ(PrintAdapters("soc-v3d"), "platform/gpu 0:0 vc4 \n"
                                        "platform/v3dbus/fec00000.gpu 0:0 v3d \n");
    EXPECT_EQ(PrintAdapters("soc-beside-pci"), "0000:01:00.0 1002:67df amdgpu \n"
                                               "platform/ff9a0000.gpu 0:0 panfrost \n");
    EXPECT_EQ(PrintAdapters("usb-display"), "0000:00:02.0 8086:46a6 i915 \n"
                                            "pci0000:00/0000:00:14.0/usb1/1-2/1-2:1.0 0:0 udl \n");
}

// The driver of one module may have another name, and one that is built in has no module.
TEST(IdentityAdapters, HaveTheModuleOfTheirDriver)
{
    const MachineTree tree;
    const std::string card = "/sys/bus/pci/devices/0000:01:00.0/";
    const auto print = [&] { return Print(GetMachineIdentity(tree.GetFiles(), {}).fAdapters); };
    tree.Write(card + "class", "0x030200\n");
    tree.Link(card + "driver", "../../drivers/card-driver");
    EXPECT_EQ(print(), "0000:01:00.0 0:0 card-driver \n");
    tree.Link("/sys/bus/pci/drivers/card-driver/module", "../../../../module/card_module");
    tree.Write("/sys/module/card_module/version", "1.2\n");
    EXPECT_EQ(print(), "0000:01:00.0 0:0 card_module 1.2\n");
}

// A device that isn't on PCI, with one node.
class PlatformDevice {
public:
    std::string Print(const std::string& node, const std::string& driver) const
    {
        const MachineTree tree;
        tree.Link("/sys/class/drm/" + node, "../../devices/platform/x.gpu/drm/" + node);
        tree.Link("/sys/devices/platform/x.gpu/driver", "../../../bus/platform/drivers/" + driver);
        return assay_host::Print(GetMachineIdentity(tree.GetFiles(), {}).fAdapters);
    }
};

TEST(IdentityAdapters, HaveEitherKindOfNode)
{
    const PlatformDevice device;
    EXPECT_EQ(device.Print("card0", "v3d"), "platform/x.gpu 0:0 v3d \n");
    EXPECT_EQ(device.Print("renderD128", "v3d"), "platform/x.gpu 0:0 v3d \n");
    for (const char* node : {"card", "card0-DP-1", "controlD64", "renderD", "version"})
        EXPECT_EQ(device.Print(node, "v3d"), "") << node;
}

TEST(IdentityAdapters, AreNoneOfADriverOfFramebuffers)
{
    const PlatformDevice device;
    for (const char* driver : {"simple-framebuffer", "of-display"})
        EXPECT_EQ(device.Print("card0", driver), "") << driver;
}

TEST(IdentityAdapters, HaveTheDeviceThatTheLinkOfANodeNames)
{
    const struct {
        const char* fLink;
        const char* fDevice;
    } kRows[] = {
        {"../../devices/x/drm/card0", "x"}, {"../../devices/drm/card0", ""},
        {"../../devices/x/drm/card1", ""},  {"../../devices/x/card0", ""},
        {"../../device/x/drm/card0", ""},   {"card0", ""},
    };
    for (const auto& row : kRows) {
        const MachineTree tree;
        tree.Link("/sys/class/drm/card0", row.fLink);
        for (const char* const device : {"x", "drm", "drm/card0"})
            tree.Link(std::string("/sys/devices/") + device + "/driver", "../drivers/v3d");
        const std::string found = Print(GetMachineIdentity(tree.GetFiles(), {}).fAdapters);
        EXPECT_EQ(found, *row.fDevice == '\0' ? "" : std::string(row.fDevice) + " 0:0 v3d \n")
            << row.fLink;
    }
}

// The graphics driver of a virtio card is bound below the PCI function, whose driver may be built
// into the kernel.
TEST(IdentityAdapters, HaveTheDriverBelowATransport)
{
    for (const std::string transport : {"virtio-pci", "virtio_pci", "virtio", "xvirtio-pci"}) {
        const MachineTree tree;
        const std::string card = "/sys/bus/pci/devices/0000:01:00.0/";
        tree.Write(card + "class", "0x030000\n");
        tree.Link(card + "driver", "../../drivers/" + transport);
        tree.Link(card + "virtio/driver", "../drivers/no-number");
        tree.Write(card + "virtio0/status", "");
        tree.Link(card + "virtio1/driver", "../drivers/virtio_gpu");
        tree.Link(card + "virtio2/driver", "../drivers/virtio_input");
        const bool isVirtio = transport == "virtio-pci" || transport == "virtio_pci";
        EXPECT_EQ(Print(GetMachineIdentity(tree.GetFiles(), {}).fAdapters),
                  "0000:01:00.0 0:0 " + (isVirtio ? "virtio_gpu" : transport) + " \n");
    }
}

TEST(IdentityAdapters, HaveIdsOf16Bits)
{
    const MachineTree tree;
    const std::string card = "/sys/bus/pci/devices/0000:01:00.0/";
    tree.Write(card + "class", "0x030000\n");
    const auto print = [&](const char* vendor, const char* device) {
        tree.Write(card + "vendor", vendor);
        tree.Write(card + "device", device);
        return Print(GetMachineIdentity(tree.GetFiles(), {}).fAdapters);
    };
    EXPECT_EQ(print("0xffff\n", "0x0001\n"), "0000:01:00.0 ffff:1  \n");
    EXPECT_EQ(print("0x10000\n", "10de\n"), "0000:01:00.0 0:0  \n");
    EXPECT_EQ(print("0x10de x\n", "0x\n"), "0000:01:00.0 0:0  \n");
}

TEST(IdentityAdapters, AreNoFramebuffersOfTheFirmware)
{
    EXPECT_EQ(PrintAdapters("firmware-only"), "0000:01:00.0 10de:1f08  \n");
}

TEST(IdentityAdapters, ChangeTheIdentity)
{
    const AdapterTree tree("intel-integrated");
    const Identity before = Read(tree);
    EXPECT_EQ(Read(tree), before);

    const std::string added = "/sys/bus/pci/devices/0000:01:00.0/";
    tree.write(added + "class", "0x030000\n");
    tree.write(added + "vendor", "0x10de\n");
    tree.write(added + "device", "0x2484\n");
    const Identity withCard = Read(tree);
    EXPECT_NE(withCard, before);
    tree.remove(added);
    EXPECT_EQ(Read(tree), before);

    tree.write("/sys/module/i915/version", "2.0\n");
    EXPECT_NE(Read(tree), before);
}

TEST(IdentitySystem, ChangesTheIdentity)
{
    const AdapterTree tree("intel-integrated");
    tree.write("/etc/os-release", "PRETTY_NAME=\"One\"\nVERSION_ID=1\nBUILD_ID=20260101\n");
    tree.write("/proc/sys/kernel/version", "#1 SMP\n");
    const Identity before = Read(tree);
    EXPECT_EQ(before.fSystem, "One; 1; 20260101; 6.12.117+deb12-amd64; #1 SMP");
    tree.write("/proc/sys/kernel/version", "#2 SMP\n");
    EXPECT_NE(Read(tree), before);
    tree.write("/proc/sys/kernel/version", "#1 SMP\n");
    EXPECT_EQ(Read(tree), before);
    tree.write("/proc/sys/kernel/osrelease", "6.12.118+deb12-amd64\n");
    EXPECT_NE(Read(tree), before);
    tree.write("/proc/sys/kernel/osrelease", "6.12.117+deb12-amd64\n");
    tree.write("/etc/os-release", "PRETTY_NAME=\"One\"\nVERSION_ID=1\nBUILD_ID=20260102\n");
    EXPECT_NE(Read(tree), before);
    tree.remove("/etc/os-release");
    tree.write("/usr/lib/os-release", "PRETTY_NAME=\"One\"\nVERSION_ID=1\nBUILD_ID=20260101\n");
    EXPECT_EQ(Read(tree), before);
}

} // namespace
} // namespace assay_host
