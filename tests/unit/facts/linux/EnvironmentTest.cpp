// The environment, compared with what the system itself says.
#include <gtest/gtest.h>

#include <cstdlib>
#include <ctime>
#include <fstream>
#include <iterator>
#include <string>

#include <sched.h>
#include <sys/mount.h>
#include <sys/utsname.h>
#include <sys/wait.h>
#include <unistd.h>

#include "facts/Environment.h"
#include "facts/OsRelease.h"
#include "facts/TimeText.h"

namespace assay_host {
namespace {

TEST(EnvironmentOfLinux, HasTheNamesOfTheKernel)
{
    ::utsname names{};
    ASSERT_EQ(::uname(&names), 0);
    const Environment environment = GetEnvironment(true);
    EXPECT_EQ(environment.fKernel.fValue,
              std::string(names.sysname) + ' ' + names.release + ' ' + names.version);
    EXPECT_EQ(environment.fArchitecture.fValue, names.machine);
    EXPECT_EQ(environment.fHost.fValue, names.nodename);
    EXPECT_EQ(environment.fHost.fReason, "");
    EXPECT_EQ(GetEnvironment(false).fHost.fReason, "only with --identify");
}

TEST(EnvironmentOfLinux, HasTheNamesOfTheDistribution)
{
    std::ifstream file("/etc/os-release", std::ios::binary);
    if (!file)
        GTEST_SKIP() << "this system has no /etc/os-release";
    const std::string text{std::istreambuf_iterator<char>(file), {}};
    const Environment environment = GetEnvironment(false);
    EXPECT_EQ(environment.fSystem.fValue, FindOsRelease(text, "PRETTY_NAME"));
    const std::string build = FindOsRelease(text, "BUILD_ID");
    EXPECT_EQ(environment.fBuild.fValue, build.empty() ? FindOsRelease(text, "VERSION_ID") : build);
}

TEST(EnvironmentOfLinux, HasTheTimeAndItsOffset)
{
    const char* const zone = std::getenv("TZ");
    const std::string before = zone == nullptr ? "" : zone;
    ::setenv("TZ", "XYZ-5:45", 1);
    ::tzset();
    const std::string begin = MakeUtcText(std::time(nullptr));
    const Environment environment = GetEnvironment(false);
    const std::string end = MakeUtcText(std::time(nullptr));
    EXPECT_EQ(environment.fOffset, "+05:45");
    EXPECT_LE(begin, environment.fTime);
    EXPECT_LE(environment.fTime, end);
    if (zone == nullptr)
        ::unsetenv("TZ");
    else
        ::setenv("TZ", before.c_str(), 1);
    ::tzset();
}

// Has empty files in the place of those that name the system, for this process alone.
bool HideOsRelease()
{
    return ::unshare(CLONE_NEWNS) == 0 &&
           ::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
           ::mount("/dev/null", "/etc/os-release", nullptr, MS_BIND, nullptr) == 0 &&
           ::mount("/dev/null", "/usr/lib/os-release", nullptr, MS_BIND, nullptr) == 0;
}

TEST(EnvironmentOfLinux, SaysWhyTheSystemHasNoName)
{
    constexpr int kNotHidden = 77;
    const ::pid_t child = ::fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        if (!HideOsRelease())
            ::_exit(kNotHidden);
        const Environment environment = GetEnvironment(false);
        ::_exit(environment.fSystem.fReason == "no os-release names it" &&
                        environment.fBuild.fReason == "no os-release has it"
                    ? 0
                    : 1);
    }
    int status = -1;
    ASSERT_EQ(::waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status));
    if (WEXITSTATUS(status) == kNotHidden)
        GTEST_SKIP() << "only root can hide files";
    EXPECT_EQ(WEXITSTATUS(status), 0);
}

} // namespace
} // namespace assay_host
