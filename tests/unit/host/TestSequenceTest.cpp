#include "supervise/TestSequence.h"

#include <gtest/gtest.h>

#include "report/KnownKeys.h"

namespace assay_host {
namespace {

// The keys of the sequence and those that the views know come from different tables: the one tells
// how lines are predicted, the other how they are shown.
TEST(TestSequence, HasTheKeysThatTheViewsKnow)
{
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
        const std::vector<assay_host::Test>& tests =
            kind == DeviceKind::kOpenGL ? GetGLTests() : GetCLTests();
        const Table<KnownKey> known = GetDeviceKeys(kind);
        ASSERT_EQ(tests.size(), known.size());
        for (std::size_t index = 0; index < tests.size(); ++index)
            EXPECT_EQ(tests[index].GetKey("tag"), std::string("tag.") + known[index].fKey);
    }
}

TEST(TestSequence, IsSilentAtTheOptionalKeyAlone)
{
    for (const auto* tests : {&GetGLTests(), &GetCLTests()}) {
        for (const assay_host::Test& test : *tests)
            EXPECT_EQ(test.fMayBeSilent, test.fName == kOptionalKey) << test.fName;
    }
}

TEST(TestSequence, HasTheGlobalKeysInTheirOrder)
{
    std::vector<std::string> keys;
    for (const GlobalKey& key : GetFirstKeys())
        keys.emplace_back(key.fName);
    keys.emplace_back(kCLCountKey);
    keys.emplace_back(kLastKey);
    const Table<const char*> known = GetReportKeys();
    EXPECT_EQ(keys, std::vector<std::string>(known.begin(), known.end()));
}

} // namespace
} // namespace assay_host
