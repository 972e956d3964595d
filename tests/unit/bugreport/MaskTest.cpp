#include "bugreport/Mask.h"

#include <gtest/gtest.h>

namespace assay_host {
namespace {

const Mask& GetMask()
{
    static const Mask mask({{"alice", "USER"},
                            {"BOX", "HOST"},
                            {"box.example.com", "HOST"},
                            {"/home/alice/", "HOME"},
                            {"C:\\Users\\Alice", "HOME"},
                            {"Alice de Souza", "USER"},
                            {"root", "USER"},
                            {"localhost", "HOST"},
                            {"/", "HOME"},
                            {"", "USER"}});
    return mask;
}

TEST(Mask, HidesNamesAndPaths)
{
    EXPECT_EQ(GetMask().Apply("alice"), "USER");
    EXPECT_EQ(GetMask().Apply("card of Alice, on box."), "card of USER, on HOST.");
    EXPECT_EQ(GetMask().Apply("box.example.com"), "HOST");
    EXPECT_EQ(GetMask().Apply("box.other.com"), "HOST.other.com");
    EXPECT_EQ(GetMask().Apply("/home/alice/x:/home/alice"), "HOME/x:HOME");
    EXPECT_EQ(GetMask().Apply("c:/users/ALICE\\driver.dll"), "HOME\\driver.dll");
    EXPECT_EQ(GetMask().Apply("by alice de souza"), "by USER");
    EXPECT_EQ(GetMask().Apply("x=alice\nalice\t\"alice\""), "x=USER\nUSER\t\"USER\"");
    EXPECT_EQ(GetMask().Apply("alice-box"), "USER-HOST");
}

TEST(Mask, KeepsLongerWords)
{
    for (const char* const text :
         {"malice", "alice2", "_alice", "boxes", "sandbox", "Virtual_Box", "/home/alicette", ""})
        EXPECT_EQ(GetMask().Apply(text), text);
}

TEST(Mask, KeepsWhatNamesNobody)
{
    EXPECT_EQ(GetMask().Apply("root@localhost:/usr/lib"), "root@localhost:/usr/lib");
    EXPECT_EQ(Mask({}).Apply("alice"), "alice");
}

TEST(Mask, OfThisMachine)
{
    for (const Secret& secret : ListSecrets())
        EXPECT_TRUE(secret.fWord == "HOST" || secret.fWord == "USER" || secret.fWord == "HOME");
    EXPECT_FALSE(ListSecrets().empty());
}

} // namespace
} // namespace assay_host
