// Whole machines: what the join makes of each tree, and that no damage to one does more than cost
// what was damaged.
#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <set>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <unistd.h>

#include "pmutil_gpu/GPUImplWin.h"
#include "qgf/AdapterName.h"
#include "support/AdapterTree.h"

namespace pmutil {
namespace {

namespace fs = std::filesystem;

using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::IsSubsetOf;
using ::testing::Not;

GPUImplWins Join()
{
    ContextsByDeviceString contexts;
    for (const std::string& address : QGF::DisplayAdapters()) {
        const std::string name = QGF::AdapterName(address);
        contexts[name].second = QGF::OGL::DisplayDeviceKey("node", name, address);
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
    for (const auto& device : Join()) {
        text += (text.empty() ? "" : "\n") + Describe(*device);
    }
    return text;
}

std::string TreeName(const ::testing::TestParamInfo<std::string>& tree)
{
    std::string name = tree.param;
    std::replace(name.begin(), name.end(), '-', '_');
    return name;
}

class AdapterTreesTest : public ::testing::TestWithParam<std::string> {};

TEST_P(AdapterTreesTest, TheJoinMakesOfItWhatIsExpected)
{
    const AdapterTree tree(GetParam());
    EXPECT_EQ(DescribeMachine(), ReadAdapterData(GetParam(), "expected.txt"));
}

TEST_P(AdapterTreesTest, ItsReadMeSaysWhatItWasWrittenAfter)
{
    EXPECT_THAT(ReadAdapterData(GetParam(), "README.md"), HasSubstr("Written after"));
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

// Every file in turn comes to harm in every way. What was read of the other adapters stays.
TEST_P(DamagedTreeTest, DamageToOneFileCostsNoMoreThanItsAdapter)
{
    const AdapterTree tree(GetParam());
    const std::size_t adapters = QGF::DisplayAdapters().size();
    ASSERT_GT(adapters, 0U);
    for (const std::string& path : tree.files()) {
        const std::string kept = path + ".kept";
        fs::rename(path, kept);
        for (const Damage damage : kDamages) {
            fs::copy_file(kept, path);
            damage(path);
            tree.refresh();
            const std::size_t found = QGF::DisplayAdapters().size();
            EXPECT_GE(found + 1, adapters) << path;
            EXPECT_EQ(Join().size(), found) << path;
            fs::remove_all(path);
        }
        fs::rename(kept, path);
    }
}

// These have every kind of file.
INSTANTIATE_TEST_SUITE_P(Trees, DamagedTreeTest,
                         ::testing::Values("hybrid-laptop", "intel-discrete-xe", "server-bmc"),
                         TreeName);

// Watches a tree while it is read.
class Watch {
public:
    explicit Watch(const std::string& root) : fFd(inotify_init1(IN_NONBLOCK | IN_CLOEXEC))
    {
        add(root);
        for (const auto& entry : fs::recursive_directory_iterator(root)) {
            if (entry.symlink_status().type() == fs::file_type::directory) {
                add(entry.path().string());
            }
        }
    }
    ~Watch() { close(fFd); }
    Watch(const Watch&) = delete;
    Watch& operator=(const Watch&) = delete;

    bool valid() const { return fValid; }
    // The names of the files opened, and whether anything changed.
    std::set<std::string> opened;
    bool changed = false;

    void collect()
    {
        alignas(inotify_event) char buffer[65536];
        ssize_t length = 0;
        while ((length = read(fFd, buffer, sizeof buffer)) > 0) {
            for (ssize_t i = 0; i < length;) {
                const auto* event = reinterpret_cast<const inotify_event*>(buffer + i);
                if ((event->mask & IN_ISDIR) == 0 && (event->mask & IN_OPEN) != 0) {
                    opened.insert(event->name);
                }
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

// The files that wake no card; DrmAdapters.cpp and AdapterName.cpp tell why.
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
                                                 "lmem_total_bytes",
                                                 "physical_vram_size_bytes",
                                                 "information",
                                                 "osrelease",
                                                 "meminfo",
                                                 "pci.ids"};
    return gFiles;
}

TEST_P(AdapterTreesTest, ReadingItOpensOnlyFilesThatWakeNoCardAndChangesNothing)
{
    const AdapterTree tree(GetParam());
    Watch watch(tree.root());
    if (!watch.valid()) {
        GTEST_SKIP() << "this machine can't watch folders";
    }
    Join();
    watch.collect();
    EXPECT_FALSE(watch.changed);
    EXPECT_THAT(watch.opened, IsSubsetOf(HarmlessFiles()));
    if (GetParam() != "empty") {
        EXPECT_THAT(watch.opened, Contains("vendor"));
    }
    if (GetParam() == "hybrid-laptop") {
        EXPECT_THAT(watch.opened, Not(Contains("information")));
    }
}

INSTANTIATE_TEST_SUITE_P(Trees, AdapterTreesTest, ::testing::ValuesIn(AdapterTreeNames()),
                         TreeName);

} // namespace
} // namespace pmutil
