#include "memory/Envelope.h"

#include <gtest/gtest.h>

namespace assay_host {
namespace {

using Json = nlohmann::ordered_json;

const Json kContent = {{"text", "value"}, {"list", {1, -2, 3}}, {"nothing", nullptr}};

// As a later version would write it.
std::string SealAs(int format, const Json& content)
{
    Json file = Json::parse(Seal(content));
    file["format"] = format;
    file["checksum"] = MakeDigest(std::to_string(format) + "\n" + content.dump());
    return file.dump(2);
}

TEST(EnvelopeTest, ReadsWhatItWrote)
{
    const std::string text = Seal(kContent);
    EXPECT_EQ(text.back(), '\n');
    const Opened opened = Unseal(text);
    EXPECT_EQ(opened.fSoundness, Soundness::kSound);
    EXPECT_EQ(opened.fContent, kContent);
    EXPECT_EQ(opened.fContent.dump(), kContent.dump());
}

TEST(EnvelopeTest, TellsANewerFileFromADamagedOne)
{
    EXPECT_EQ(Unseal(SealAs(kStateFormat, kContent)).fSoundness, Soundness::kSound);
    EXPECT_EQ(Unseal(SealAs(kStateFormat + 1, {{"other", 1}})).fSoundness, Soundness::kNewer);
    EXPECT_EQ(Unseal(SealAs(kStateFormat - 1, kContent)).fSoundness, Soundness::kDamaged);
    Json changed = Json::parse(Seal(kContent));
    changed["format"] = kStateFormat + 1;
    EXPECT_EQ(Unseal(changed.dump()).fSoundness, Soundness::kDamaged);
}

TEST(EnvelopeTest, NoCutFileIsSound)
{
    const std::string text = Seal(kContent);
    for (std::size_t size = 0; size + 1 < text.size(); ++size)
        EXPECT_EQ(Unseal(text.substr(0, size)).fSoundness, Soundness::kDamaged) << size;
}

// A changed blank between two members leaves the content as it was.
TEST(EnvelopeTest, AChangedBitLeavesTheContentOrDamagesTheFile)
{
    const std::string text = Seal(kContent);
    std::size_t damaged = 0;
    for (std::size_t bit = 0; bit < 8 * text.size(); ++bit) {
        std::string changed = text;
        changed[bit / 8] = static_cast<char>(changed[bit / 8] ^ (1 << bit % 8));
        const Opened opened = Unseal(changed);
        if (opened.fSoundness == Soundness::kSound)
            EXPECT_EQ(opened.fContent, kContent) << bit;
        else
            EXPECT_EQ(opened.fSoundness, Soundness::kDamaged) << bit;
        damaged += opened.fSoundness == Soundness::kDamaged ? 1 : 0;
    }
    EXPECT_GT(damaged, 7 * text.size());
}

TEST(EnvelopeTest, RefusesWhatIsNoFile)
{
    for (const char* const text :
         {"", "null", "[]", "{}", "1", "\"text\"", "{\"format\": 1}",
          "{\"format\": \"1\", \"checksum\": 1, \"content\": {}}",
          "{\"format\": 99999999999999999999, \"checksum\": \"\", \"content\": {}}"})
        EXPECT_EQ(Unseal(text).fSoundness, Soundness::kDamaged) << text;
    EXPECT_EQ(Unseal(std::string(kMaxStateBytes, '[')).fSoundness, Soundness::kDamaged);
    std::string deep;
    for (std::size_t level = 0; level < kMaxStateBytes / 8; ++level)
        deep += "{\"a\":[";
    EXPECT_EQ(Unseal(deep).fSoundness, Soundness::kDamaged);
}

TEST(EnvelopeTest, DigestsAreNamesOfFiles)
{
    EXPECT_EQ(MakeDigest("text"), MakeDigest("text"));
    EXPECT_NE(MakeDigest("text"), MakeDigest("texu"));
    EXPECT_EQ(MakeDigest("").size(), 36u);
    EXPECT_EQ(MakeDigest("text").find_first_not_of("0123456789abcdef-"), std::string::npos);
}

} // namespace
} // namespace assay_host
