// The file that the library is in.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <sstream>
#include <string>
#include <system_error>

#include <sched.h>
#include <sys/mount.h>
#include <sys/wait.h>
#include <unistd.h>

#include "library/OwnFile.h"
#include "library/linux/MappedFile.h"

namespace {

namespace fs = std::filesystem;

TEST(MappedFile, IsThatOfTheMappingWithTheAddress)
{
    const char* const text = "words /no/mapping\n"
                             "1000-2000 r--p 00000000 08:01 11      /lib/a b.so\n"
                             "2000-3000 r-xp 00001000 08:01 11      /lib/a b.so\n"
                             "4000-5000 rw-p 00000000 00:00 0 \n"
                             "5000-6000 rw-p 00000000 00:00 0       [heap]\n"
                             "FFFFFFFFFF000-FFFFFFFFFFFFF r-xp 00000000 08:01 12 /lib/high.so\n";
    const struct {
        std::uintptr_t fAddress;
        const char* fFile;
    } rows[] = {{0, ""},
                {0xFFF, ""},
                {0x1000, "/lib/a b.so"},
                {0x1FFF, "/lib/a b.so"},
                {0x2FFF, "/lib/a b.so"},
                {0x3000, ""},
                {0x4000, ""},
                {0x5000, ""},
                {0xFFFFFFFFFF000, "/lib/high.so"},
                {0xFFFFFFFFFFFFF, ""}};
    for (const auto& row : rows) {
        std::istringstream maps(text);
        EXPECT_EQ(assay_host::FindMappedFile(maps, row.fAddress), row.fFile)
            << std::hex << row.fAddress;
    }
}

TEST(OwnFile, IsThisProgram)
{
    EXPECT_EQ(assay_host::GetOwnFile().string(), fs::canonical("/proc/self/exe").string());
}

TEST(OwnFile, IsKnownWithoutTheKernelsListToo)
{
    constexpr int kNotHidden = 77;
    const fs::path program = fs::canonical("/proc/self/exe");
    const ::pid_t child = ::fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        if (::unshare(CLONE_NEWNS) != 0 ||
            ::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0 ||
            ::mount("none", "/proc", "tmpfs", 0, nullptr) != 0)
            ::_exit(kNotHidden);
        std::error_code error;
        const fs::path found = fs::canonical(assay_host::GetOwnFile().string(), error);
        ::_exit(found == program ? 0 : 1);
    }
    int status = -1;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status));
    if (WEXITSTATUS(status) == kNotHidden)
        GTEST_SKIP() << "only root can hide /proc";
    EXPECT_EQ(WEXITSTATUS(status), 0);
}

} // namespace
