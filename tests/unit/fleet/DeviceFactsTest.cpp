#include "fleet/DeviceFacts.h"

#include <gtest/gtest.h>

#include <cctype>
#include <set>
#include <string>

#include "report/KnownKeys.h"

namespace assay_host {
namespace {

TEST(DeviceFacts, HaveKeysOfTheTable)
{
    std::set<std::string> names;
    for (const FactKey& key : GetFactKeys()) {
        EXPECT_TRUE(names.insert(key.fName).second) << key.fName;
        if (key.fGLKey)
            EXPECT_NE(FindKnownKey(DeviceKind::kOpenGL, key.fGLKey), nullptr) << key.fGLKey;
        if (key.fCLKey)
            EXPECT_NE(FindKnownKey(DeviceKind::kOpenCL, key.fCLKey), nullptr) << key.fCLKey;
    }
}

// A sentence in one line, which needs no escape.
TEST(DeviceFacts, HaveAHelpText)
{
    for (const FactKey& key : GetFactKeys()) {
        const std::string help = key.fHelp;
        EXPECT_EQ(help.back(), '.');
        EXPECT_TRUE(std::isupper(static_cast<unsigned char>(help.front())));
        EXPECT_EQ(help.find_first_of("\\\n\""), std::string::npos) << help;
    }
}

// A unit in a name must be that of the key's form, and the other way round.
TEST(DeviceFacts, HaveTheirUnitInTheName)
{
    const auto endsWith = [](const std::string& text, const std::string& end) {
        return text.size() > end.size() &&
               text.compare(text.size() - end.size(), end.size(), end) == 0;
    };
    for (const FactKey& key : GetFactKeys()) {
        for (const KnownKey* known :
             {key.fGLKey ? FindKnownKey(DeviceKind::kOpenGL, key.fGLKey) : nullptr,
              key.fCLKey ? FindKnownKey(DeviceKind::kOpenCL, key.fCLKey) : nullptr}) {
            if (!known)
                continue;
            EXPECT_EQ(endsWith(key.fName, "_bytes"), known->fForm == ValueForm::kMebibytes);
            EXPECT_EQ(endsWith(key.fName, "_bytes_per_second"),
                      known->fForm == ValueForm::kBytesPerSecond);
            EXPECT_EQ(key.fIsStable, known->fMatch != Match::kNumber) << key.fName;
        }
    }
}

TEST(DeviceFacts, NumbersKeepTheirDigits)
{
    EXPECT_EQ(MakeNumberText(0), "0");
    EXPECT_EQ(MakeNumberText(25757220864.0), "25757220864");
    EXPECT_EQ(MakeNumberText(9007199254740992.0), "9007199254740992");
    EXPECT_EQ(MakeNumberText(1e300), "1e+300");
    EXPECT_EQ(MakeNumberText(0.1), "0.1");
    EXPECT_EQ(MakeNumberText(1234.56), "1234.56");
}

} // namespace
} // namespace assay_host
