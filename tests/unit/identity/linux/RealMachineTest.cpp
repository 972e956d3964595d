// Compares with the tools of the dynamic loader on this machine.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <memory>
#include <set>
#include <sstream>
#include <string>

#include "identity/Identity.h"
#include "identity/linux/Files.h"
#include "identity/linux/LibraryCache.h"

namespace assay_host {
namespace {

std::string GetOutput(const std::string& command)
{
    // NOLINTNEXTLINE(cert-env33-c): fixed tools.
    const std::unique_ptr<FILE, int (*)(FILE*)> output(::popen(command.c_str(), "r"), ::pclose);
    std::string text;
    char block[4096];
    std::size_t count = 0;
    while (output && (count = std::fread(block, 1, sizeof(block), output.get())) != 0)
        text.append(block, count);
    return text;
}

// ldd prints "\tNAME => PATH (ADDRESS)".
TEST(RealMachine, HasEveryLibraryThatTheLoaderWouldMap)
{
    const Files files;
    const Identity identity = GetIdentity("/proc/self/exe");
    std::set<std::pair<DeviceKind, std::string>> listed;
    for (const DriverFile& file : identity.fFiles)
        listed.emplace(file.fInterface, file.fPath);
    std::size_t count = 0;
    for (const DriverFile& file : identity.fFiles) {
        std::istringstream lines(GetOutput("ldd " + file.fPath + " 2>/dev/null"));
        for (std::string line; std::getline(lines, line);) {
            const std::size_t arrow = line.find(" => /");
            if (arrow == std::string::npos)
                continue;
            const std::string path =
                files.Resolve(line.substr(arrow + 4, line.rfind(" (") - arrow - 4));
            static const std::set<std::string> gRuntime = {
                "libc.so.6",  "libm.so.6",     "libdl.so.2",    "libpthread.so.0",
                "librt.so.1", "libgcc_s.so.1", "libstdc++.so.6"};
            if (gRuntime.count(line.substr(1, arrow - 1)) != 0)
                continue;
            ++count;
            EXPECT_EQ(listed.count({file.fInterface, path}), 1U) << file.fPath << " needs " << path;
        }
    }
    if (count == 0)
        GTEST_SKIP() << "no driver or no ldd on this machine";
}

// ldconfig prints "\tNAME (KIND) => PATH".
TEST(RealMachine, HasTheLibrariesOfTheCache)
{
    std::istringstream lines(GetOutput("PATH=$PATH:/sbin:/usr/sbin ldconfig -p 2>/dev/null"));
    const LibraryCache cache(Files().Read("/etc/ld.so.cache", std::size_t{16} << 20));
    std::size_t count = 0;
    for (std::string line; std::getline(lines, line);) {
        const std::size_t arrow = line.find(" => ");
        const std::size_t kind = line.find(" (");
        // "libc6,x86-64" or "libc6,AArch64"; variants have more.
        if (arrow == std::string::npos || line.find("libc6,") == std::string::npos)
            continue;
        ++count;
        const std::vector<std::string> paths = cache.Find(line.substr(1, kind - 1));
        EXPECT_NE(std::find(paths.begin(), paths.end(), line.substr(arrow + 4)), paths.end())
            << line;
    }
    if (count == 0)
        GTEST_SKIP() << "no cache or no ldconfig on this machine";
}

TEST(RealMachine, HasTheBuildIdsThatReadelfPrints)
{
    const Identity identity = GetIdentity("/proc/self/exe");
    std::size_t count = 0;
    for (const DriverFile& file : identity.fFiles) {
        const std::string notes = GetOutput("readelf -n " + file.fPath + " 2>/dev/null");
        static const std::string gKey = "Build ID: ";
        const std::size_t begin = notes.find(gKey);
        if (begin == std::string::npos)
            continue;
        ++count;
        const std::size_t text = begin + gKey.size();
        EXPECT_EQ(file.fBuildId, notes.substr(text, notes.find('\n', text) - text)) << file.fPath;
    }
    if (count == 0)
        GTEST_SKIP() << "no driver or no readelf on this machine";
}

TEST(RealMachine, StaysTheSame)
{
    const Identity identity = GetIdentity("/proc/self/exe");
    EXPECT_EQ(GetIdentity("/proc/self/exe"), identity);
    EXPECT_NE(identity.fSystem, "");
}

} // namespace
} // namespace assay_host
