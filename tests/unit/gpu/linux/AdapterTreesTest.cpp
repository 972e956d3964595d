// Whole machines: the devices that the join makes of each tree, and that a damaged file affects no
// other adapter.
#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <regex>
#include <set>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <unistd.h>

#include "pmutil_gpu/GPUImplWin.h"
#include "qgf/AdapterName.h"
#include "qgf/DrmNodes.h"
#include "support/AdapterTree.h"

namespace pmutil {
namespace {

namespace fs = std::filesystem;

using ::testing::AnyOf;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::IsSubsetOf;
using ::testing::Not;

// The places where a context can be made: adapters with a DRM node and the NVIDIA driver's cards.
std::set<std::string> PlacesWithDriver()
{
    std::set<std::string> places;
    for (const QGF::DrmNode& node : QGF::DrmNodes())
        places.insert(node.place);
    for (const std::string& card : QGF::ListSystemFolder("/proc/driver/nvidia/gpus"))
        places.insert(card);
    return places;
}

GPUImplWins Join()
{
    ContextsByDeviceString contexts;
    for (const std::string& place : PlacesWithDriver()) {
        const std::string name = QGF::AdapterName(place);
        contexts[name].second = QGF::OGL::DisplayDeviceKey("node", name, place);
    }
    return JoinDevices(contexts, DXGIData::GetAllDevices(), WMIData::GetAllDevices());
}

std::string Describe(GPUImplWin& device)
{
    const std::uint32_t memory =
        std::max(device.fWMI.GetMemoryMB() >> 20, device.fDXGI.GetMemoryMB());
    char ids[64];
    std::snprintf(ids, sizeof ids, "vendor=0x%04x device=0x%04x\n", device.GetGLVendorID(),
                  device.GetGLRendererID());
    return "name=" + device.GetGLName() + "\n" + ids + "driver=" + device.GetGLDriver() +
           " version=" + device.GetGLDriverVersion() + " date=" + device.GetGLDriverDate() +
           "\nmemoryMB=" + std::to_string(memory) +
           "\nintegrated=" + (device.IsIntegratedGLGPU() ? "yes" : "no") + "\n";
}

std::string DescribeMachine()
{
    std::string text;
    for (const auto& device : Join())
        text += (text.empty() ? "" : "\n") + Describe(*device);
    return text;
}

std::string TreeName(const ::testing::TestParamInfo<std::string>& tree)
{
    std::string name = tree.param;
    std::replace(name.begin(), name.end(), '-', '_');
    return name;
}

class AdapterTreesTest : public ::testing::TestWithParam<std::string> {};

TEST_P(AdapterTreesTest, TheJoinGivesTheExpectedDevices)
{
    const AdapterTree tree(GetParam());
    EXPECT_EQ(DescribeMachine(), ReadAdapterData(GetParam(), "expected.txt"));
}

TEST_P(AdapterTreesTest, ItsReadMeNamesItsOrigin)
{
    EXPECT_THAT(ReadAdapterData(GetParam(), "README.md"),
                AnyOf(HasSubstr("\nWritten from"), HasSubstr("\nRecorded with")));
}

using Damage = void (*)(const std::string& path);

void Overwrite(const std::string& path, const std::string& text)
{
    std::ofstream(path, std::ios::binary | std::ios::trunc) << text;
}

constexpr Damage kDamages[] = {
    [](const std::string& path) { fs::remove(path); },
    [](const std::string& path) { Overwrite(path, ""); },
    [](const std::string& path) { fs::resize_file(path, fs::file_size(path) / 2); },
    [](const std::string& path) { Overwrite(path, std::string(100000, '9')); },
    [](const std::string& path) { Overwrite(path, std::string("\0\xff\x80:\n\0x", 7)); },
    [](const std::string& path) {
        fs::remove(path);
        fs::create_directory(path);
    },
    [](const std::string& path) {
        fs::remove(path);
        fs::create_symlink(fs::path(path).filename(), path); // a link to itself
    },
    [](const std::string& path) {
        fs::remove(path);
        ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
    },
};

class DamagedTreeTest : public ::testing::TestWithParam<std::string> {};

// Damages each file in each way. The other adapters must stay.
TEST_P(DamagedTreeTest, DamageToOneFileCostsNoMoreThanItsAdapter)
{
    const AdapterTree tree(GetParam());
    const std::size_t adapters = QGF::DisplayAdapters().size();
    ASSERT_GT(adapters, 0U);
    ASSERT_EQ(Join().size(), adapters);
    for (const std::string& path : tree.files()) {
        const std::string kept = path + ".kept";
        fs::rename(path, kept);
        for (const Damage damage : kDamages) {
            fs::copy_file(kept, path);
            damage(path);
            tree.refresh();
            const std::size_t found = QGF::DisplayAdapters().size();
            EXPECT_GE(found + 1, adapters) << path;
            EXPECT_GE(Join().size() + 1, found) << path;
            fs::remove_all(path);
        }
        fs::rename(kept, path);
    }
}

// Together these trees have every kind of file.
INSTANTIATE_TEST_SUITE_P(Trees, DamagedTreeTest,
                         ::testing::Values("hybrid-laptop", "intel-arc-xe", "radeon", "server-bmc",
                                           "soc-beside-pci"),
                         TreeName);

// Records which files of a tree are opened and whether it is changed, by inotify.
class Watch {
public:
    explicit Watch(const std::string& root) : fFd(inotify_init1(IN_NONBLOCK | IN_CLOEXEC))
    {
        add(root);
        for (const auto& entry : fs::recursive_directory_iterator(root))
            if (entry.symlink_status().type() == fs::file_type::directory)
                add(entry.path().string());
    }
    ~Watch() { close(fFd); }
    Watch(const Watch&) = delete;
    Watch& operator=(const Watch&) = delete;

    bool valid() const { return fValid; }
    std::set<std::string> opened; // file names
    bool changed = false;

    void collect()
    {
        alignas(inotify_event) char buffer[65536];
        ssize_t length = 0;
        while ((length = read(fFd, buffer, sizeof buffer)) > 0) {
            for (ssize_t i = 0; i < length;) {
                const auto* event = reinterpret_cast<const inotify_event*>(buffer + i);
                if ((event->mask & IN_ISDIR) == 0 && (event->mask & IN_OPEN) != 0)
                    opened.insert(event->name);
                changed |= (event->mask & (IN_MODIFY | IN_CREATE | IN_DELETE | IN_ATTRIB |
                                           IN_CLOSE_WRITE | IN_MOVE)) != 0;
                i += static_cast<ssize_t>(sizeof *event + event->len);
            }
        }
    }

private:
    void add(const std::string& folder)
    {
        fValid &= inotify_add_watch(fFd, folder.c_str(), IN_ALL_EVENTS) >= 0;
    }

    int fFd;
    bool fValid = true;
};

// The files that don't wake a suspended card; DrmAdapters.cpp and AdapterName.cpp give the reasons.
const std::set<std::string>& HarmlessFiles()
{
    static const std::set<std::string> gFiles = {"class",
                                                 "vendor",
                                                 "device",
                                                 "revision",
                                                 "product_name",
                                                 "subsystem_vendor",
                                                 "subsystem_device",
                                                 "status",
                                                 "modes",
                                                 "runtime_status",
                                                 "version",
                                                 "mem_info_vram_total",
                                                 "mem_info_gtt_total",
                                                 "resource",
                                                 "uevent",
                                                 "information",
                                                 "osrelease",
                                                 "meminfo",
                                                 "pci.ids"};
    return gFiles;
}

// Removes the recorded answers of drivers, which SuspendedCardTest checks.
std::set<std::string> WithoutRecordedAnswers(std::set<std::string> files)
{
    for (auto file = files.begin(); file != files.end();)
        file = file->compare(0, 7, "renderD") == 0 ? files.erase(file) : std::next(file);
    return files;
}

TEST_P(AdapterTreesTest, OnlyHarmlessFilesAreOpenedAndNothingIsChanged)
{
    const AdapterTree tree(GetParam());
    Watch watch(tree.root());
    if (!watch.valid())
        GTEST_SKIP() << "inotify can't watch all folders on this machine";
    Join();
    watch.collect();
    EXPECT_FALSE(watch.changed);
    EXPECT_THAT(WithoutRecordedAnswers(watch.opened), IsSubsetOf(HarmlessFiles()));
    if (!QGF::DisplayAdapters().empty())
        EXPECT_THAT(watch.opened, AnyOf(Contains("vendor"), Contains("uevent")));
    if (GetParam() == "hybrid-laptop")
        EXPECT_THAT(watch.opened, Not(Contains("information")));
}

// Reading a recorded answer stands for opening the node of a real machine.
std::set<std::string> NodesOpened(const AdapterTree& tree)
{
    Watch watch(tree.root());
    Join();
    watch.collect();
    std::set<std::string> nodes;
    for (const std::string& name : watch.opened)
        if (name.compare(0, 7, "renderD") == 0)
            nodes.insert(name);
    return nodes;
}

TEST(SuspendedCardTest, ANodeIsOpenedOnlyWhileItsCardIsActive)
{
    const AdapterTree tree("intel-arc-xe");
    const std::string status = "/sys/bus/pci/devices/0000:03:00.0/power/runtime_status";
    if (!Watch(tree.root()).valid())
        GTEST_SKIP() << "inotify can't watch all folders on this machine";
    EXPECT_THAT(NodesOpened(tree), ElementsAre("renderD128.xe"));
    for (const char* state :
         {"suspended", "suspending", "resuming", "error", "unsupported", "", "activity"}) {
        tree.write(status, std::string(state) + "\n");
        EXPECT_THAT(NodesOpened(tree), IsEmpty()) << state;
    }
    tree.remove(status);
    EXPECT_THAT(NodesOpened(tree), IsEmpty());
}

TEST(SuspendedCardTest, OnlyTheActiveOneOfTwoCardsIsQueried)
{
    const AdapterTree tree("intel-arc-asleep");
    if (!Watch(tree.root()).valid())
        GTEST_SKIP() << "inotify can't watch all folders on this machine";
    tree.write("/dev/dri/renderD129.i915", "the answer of a suspended card");
    EXPECT_THAT(NodesOpened(tree), ElementsAre("renderD128.i915"));
}

// Makes a row of the table from the lines of a device.
std::string Row(const std::string& device)
{
    static const std::regex gForm("name=(.*)\nvendor=(.*) device=(.*)\ndriver=(.*) version=(.*) "
                                  "date=(.*)\nmemoryMB=(.*)\nintegrated=(.*)\n");
    std::smatch found;
    if (!std::regex_match(device, found, gForm))
        return device;
    const auto text = [&](std::size_t i) { return found[i].str().empty() ? "-" : found[i].str(); };
    return text(1) + " | " + text(2) + ":" + text(3) + " | " + text(7) + " MB | " + text(8) +
           " | " + text(4) + " | " + text(5) + " | " + text(6);
}

std::vector<std::string> Rows(const std::string& description)
{
    std::vector<std::string> rows;
    for (std::size_t begin = 0; begin < description.size();) {
        const std::size_t end = std::min(description.find("\n\n", begin), description.size() - 1);
        rows.push_back(Row(description.substr(begin, end + 1 - begin)));
        begin = end + 2;
    }
    return rows;
}

// Prints a table of the expected and the reported values of each machine.
TEST(AdapterTableTest, EveryMachineReportsWhatIsExpected)
{
    std::size_t machines = 0;
    std::string table = "machine | name | ids | memory | integrated | driver | version | date\n";
    for (const std::string& name : AdapterTreeNames()) {
        const AdapterTree tree(name);
        std::vector<std::string> expected = Rows(ReadAdapterData(name, "expected.txt"));
        std::vector<std::string> reported = Rows(DescribeMachine());
        EXPECT_EQ(expected, reported) << name;
        machines += expected.empty() ? 0U : 1U;
        const std::size_t count = std::max(expected.size(), reported.size());
        expected.resize(count, "(no device)");
        reported.resize(count, "(no device)");
        table += count == 0 ? name + " | expected and reported: no device\n" : "";
        for (std::size_t i = 0; i != count; ++i) {
            table += name + " | expected | " + expected[i] + "\n" + name + " | reported | " +
                     reported[i] + (expected[i] == reported[i] ? "" : " <- differs") + "\n";
        }
    }
    std::cout << table << machines << " machines with a device\n";
    EXPECT_GE(machines, 24U);
}

INSTANTIATE_TEST_SUITE_P(Trees, AdapterTreesTest, ::testing::ValuesIn(AdapterTreeNames()),
                         TreeName);

} // namespace
} // namespace pmutil
