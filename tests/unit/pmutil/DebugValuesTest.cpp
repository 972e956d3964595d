#include "pmutil/DebugValues.h"

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include <boost/thread/thread.hpp>
#include <gmock/gmock.h>

#include "FreshProcess.h"
#include "pmutil/PMLogging.h"

namespace pmutil {
namespace {

class DebugValuesTest : public testing::Test {
protected:
    void SetUp() override { InitLogging(); }
};

TEST_F(DebugValuesTest, StartsWithItsInitialValue)
{
    static DebugValue zero{"DebugValuesTest.zero", 0};
    static DebugValue negative{"DebugValuesTest.negative", -7};
    EXPECT_EQ(GetDebugValue(zero), 0);
    EXPECT_EQ(GetDebugValue(negative), -7);
    EXPECT_NE(zero.index, 0);
    EXPECT_NE(negative.index, zero.index);
}

TEST_F(DebugValuesTest, InitialValueIsStoredAtTheFirstResolutionOnly)
{
    static DebugValue record{"DebugValuesTest.once", 5};
    GetDebugValue(record) = 6;
    EXPECT_EQ(GetDebugValue(record), 6);
    static DebugValue other{"DebugValuesTest.once", 9};
    EXPECT_EQ(GetDebugValue(other), 6);
}

TEST_F(DebugValuesTest, RecordsWithOneNameShareTheValue)
{
    const std::string name = "DebugValuesTest.shared"; // a different pointer
    static DebugValue first{"DebugValuesTest.shared", 0};
    DebugValue second{name.c_str(), 0};
    EXPECT_EQ(&GetDebugValue(first), &GetDebugValue(second));
    GetDebugValue(second) = 3;
    EXPECT_EQ(GetDebugValue(first), 3);
}

TEST_F(DebugValuesTest, NameForValuesFromOutsideIsKept)
{
    EXPECT_STREQ(kDebugFlagsName, "AssayDebugFlags");
}

TEST_F(DebugValuesTest, UnresolvedRecordMayBeSet)
{
    static DebugValue record{"DebugValuesTest.maybe", 0};
    EXPECT_TRUE(detail::MayBeSet(record));
    GetDebugValue(record) = 0;
    EXPECT_FALSE(detail::MayBeSet(record));
    GetDebugValue(record) = -1;
    EXPECT_TRUE(detail::MayBeSet(record));
}

TEST_F(DebugValuesTest, ThreadsResolveARecordToOneSlot)
{
    static DebugValue record{"DebugValuesTest.threads", 4};
    std::vector<DebugInteger*> found(8);
    boost::thread_group threads;
    for (DebugInteger*& value : found)
        threads.create_thread([&value] { value = &GetDebugValue(record); });
    threads.join_all();
    EXPECT_THAT(found, testing::Each(&GetDebugValue(record)));
    EXPECT_EQ(GetDebugValue(record), 4);
}

TEST(DebugValuesDeathTest, BeforeInitLoggingAllShareTheOverflowSlotAndNothingIsCached)
{
    ExpectInFreshProcess([] {
        static DebugValue first{"first", 1};
        static DebugValue second{"second", 2};
        REQUIRE_SO(GetDebugValue(first) == 0); // not even the initial value
        REQUIRE_SO(&GetDebugValue(first) == &GetDebugValue(second));
        REQUIRE_SO(first.index == 0);
        DebugInteger& overflow = GetDebugValue(first);
        overflow = 42;
        REQUIRE_SO(GetDebugValue(second) == 42);
        InitLogging();
        REQUIRE_SO(GetDebugValue(first) == 1);
        REQUIRE_SO(GetDebugValue(second) == 2);
        REQUIRE_SO(&GetDebugValue(first) != &overflow);
        REQUIRE_SO(first.index == 1);
        REQUIRE_SO(second.index == 2);
    });
}

TEST(DebugValuesDeathTest, TheHundredAndFirstNameGetsTheOverflowSlot)
{
    ExpectInFreshProcess([] {
        static DebugValue early{"early", 0};
        DebugInteger& overflow = GetDebugValue(early); // logging hasn't started
        InitLogging();
        std::vector<std::string> names;
        names.reserve(102);
        for (int number = 0; number < 102; ++number)
            names.push_back("name" + std::to_string(number));
        std::vector<std::unique_ptr<DebugValue>> records;
        records.reserve(names.size());
        for (const std::string& name : names)
            records.push_back(std::make_unique<DebugValue>(name.c_str(), 5));
        for (std::size_t number = 0; number < 100; ++number) {
            REQUIRE_SO(GetDebugValue(*records[number]) == 5);
            REQUIRE_SO(records[number]->index == static_cast<int>(number) + 1);
        }
        for (std::size_t number = 100; number < 102; ++number) {
            REQUIRE_SO(&GetDebugValue(*records[number]) == &overflow);
            REQUIRE_SO(records[number]->index == 0);
        }
        REQUIRE_SO(overflow == 0); // the initial value is not stored there
        DebugValue again{"name50", 1};
        REQUIRE_SO(&GetDebugValue(again) == &GetDebugValue(*records[50])); // known names resolve
    });
}

} // namespace
} // namespace pmutil
