// The secrets of a machine and a user that stand in for those of the system.
#include <algorithm>
#include <cstdlib>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <pwd.h>
#include <unistd.h>

#include "bugreport/Mask.h"

namespace {

constexpr char kNoText[] = "-"; // stands for a null pointer

struct Account {
    std::string fName;
    std::string fFolder;
    std::string fMore;
};

struct FakeSystem {
    int fHostStatus = 0;
    std::string fHost = "box";
    std::map<std::string, Account> fAccounts; // by the name that is asked for
    std::optional<Account> fUser;
};

FakeSystem& GetSystem()
{
    static FakeSystem system;
    return system;
}

::passwd* ReturnEntry(Account& account)
{
    static ::passwd entry;
    entry.pw_name = account.fName.data();
    entry.pw_dir = account.fFolder.data();
    entry.pw_gecos = account.fMore == kNoText ? nullptr : account.fMore.data();
    return &entry;
}

} // namespace

// These are called instead of those of the C library.
extern "C" {

// Without a terminator if the name fills the buffer.
int gethostname(char* name, std::size_t size) noexcept
{
    const std::string& host = GetSystem().fHost;
    std::copy_n(host.c_str(), std::min(size, host.size() + 1), name);
    return GetSystem().fHostStatus;
}

::passwd* getpwnam(const char* name)
{
    const auto found = GetSystem().fAccounts.find(name);
    return found == GetSystem().fAccounts.end() ? nullptr : ReturnEntry(found->second);
}

::passwd* getpwuid(::uid_t user)
{
    return user == ::getuid() && GetSystem().fUser ? ReturnEntry(*GetSystem().fUser) : nullptr;
}
}

namespace assay_host {
namespace {

constexpr const char* kVariables[] = {"HOME", "USER", "LOGNAME", "SUDO_USER"};

class SecretsTest : public testing::Test {
protected:
    SecretsTest()
    {
        for (const char* const name : kVariables) {
            const char* const value = std::getenv(name);
            fBefore.push_back(value ? std::optional<std::string>(value) : std::nullopt);
            ::unsetenv(name);
        }
    }

    ~SecretsTest() override
    {
        GetSystem() = {};
        for (std::size_t index = 0; index < fBefore.size(); ++index)
            if (fBefore[index])
                ::setenv(kVariables[index], fBefore[index]->c_str(), 1);
            else
                ::unsetenv(kVariables[index]);
    }

    // Returns "WORD text" lines, without the empty texts, which stand for nothing.
    static std::string List()
    {
        std::string list;
        for (const Secret& secret : ListSecrets())
            if (!secret.fText.empty())
                list += secret.fWord + " " + secret.fText + "\n";
        return list;
    }

private:
    std::vector<std::optional<std::string>> fBefore;
};

TEST_F(SecretsTest, OfTheMachine)
{
    EXPECT_EQ(List(), "HOST box\nHOST box\n");
    GetSystem().fHost = "box.example.com";
    EXPECT_EQ(List(), "HOST box.example.com\nHOST box\n");
    GetSystem().fHost = std::string(300, 'h');
    const std::string longest(255, 'h');
    EXPECT_EQ(List(), "HOST " + longest + "\nHOST " + longest + "\n");
    GetSystem().fHostStatus = -1;
    EXPECT_EQ(List(), "");
}

TEST_F(SecretsTest, OfTheEnvironment)
{
    GetSystem().fHostStatus = -1;
    ::setenv("HOME", "/home/a", 1);
    ::setenv("USER", "b", 1);
    ::setenv("LOGNAME", "c", 1);
    ::setenv("SUDO_USER", "d", 1);
    EXPECT_EQ(List(), "HOME /home/a\nUSER b\nUSER c\nUSER d\n");
}

TEST_F(SecretsTest, OfTheAccountsThatTheEnvironmentNames)
{
    GetSystem().fHostStatus = -1;
    GetSystem().fAccounts = {{"", {"nobody", "/none", "Nobody"}},
                             {"b", {"bob", "/home/bob", "Bob Builder,Room 1,,"}},
                             {"d", {"dora", "/home/dora", "Dora"}}};
    ::setenv("USER", "b", 1);
    ::setenv("LOGNAME", "", 1);
    ::setenv("SUDO_USER", "d", 1);
    EXPECT_EQ(List(), "USER b\nUSER bob\nHOME /home/bob\nUSER Bob Builder\n"
                      "USER d\nUSER dora\nHOME /home/dora\nUSER Dora\n");
}

TEST_F(SecretsTest, OfTheUser)
{
    GetSystem().fHostStatus = -1;
    GetSystem().fUser = {"eve", "/home/eve", "Eve,"};
    EXPECT_EQ(List(), "USER eve\nHOME /home/eve\nUSER Eve\n");
    GetSystem().fUser->fMore = kNoText;
    EXPECT_EQ(List(), "USER eve\nHOME /home/eve\n");
}

} // namespace
} // namespace assay_host
