#include "memory/Envelope.h"

#include <gtest/gtest.h>

#include "Samples.h"

namespace assay_host {
namespace {

using Json = nlohmann::ordered_json;

const Json kContent = {{"text", "value"}, {"list", {1, -2, 3}}, {"nothing", nullptr}};

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
    EXPECT_EQ(SealAs(kStateFormat, kContent), Seal(kContent));
    EXPECT_EQ(Unseal(SealAs(kStateFormat + 1, {{"other", 1}})).fSoundness, Soundness::kNewer);
    EXPECT_EQ(Unseal(SealAs(kStateFormat - 1, kContent)).fSoundness, Soundness::kDamaged);
    std::string changed = Seal(kContent);
    changed[changed.find(std::to_string(kStateFormat))] = '9';
    EXPECT_EQ(Unseal(changed).fSoundness, Soundness::kDamaged);
}

TEST(EnvelopeTest, NoCutFileIsSound)
{
    const std::string text = Seal(kContent);
    for (std::size_t size = 0; size < text.size(); ++size)
        EXPECT_EQ(Unseal(text.substr(0, size)).fSoundness, Soundness::kDamaged) << size;
}

TEST(EnvelopeTest, NoFileWithAChangedBitIsSound)
{
    const std::string text = Seal(kContent);
    for (std::size_t bit = 0; bit < 8 * text.size(); ++bit) {
        std::string changed = text;
        changed[bit / 8] = static_cast<char>(changed[bit / 8] ^ (1 << bit % 8));
        EXPECT_EQ(Unseal(changed).fSoundness, Soundness::kDamaged) << bit;
    }
}

TEST(EnvelopeTest, RefusesWhatIsNoFile)
{
    for (const char* const text :
         {"", "null", "[]", "{}", "1", "\"text\"", "{\"format\": 1}",
          "{\"format\": \"1\", \"checksum\": 1, \"content\": {}}",
          "{\"format\": 99999999999999999999, \"checksum\": \"\", \"content\": {}}"})
        EXPECT_EQ(Unseal(text).fSoundness, Soundness::kDamaged) << text;
    EXPECT_EQ(Unseal(std::string(kMaxStateBytes, '[')).fSoundness, Soundness::kDamaged);
}

TEST(EnvelopeTest, RefusesWhatIsDeeperThanAnyContent)
{
    const auto nest = [](int levels) {
        Json content = 1;
        for (int level = 0; level < levels; ++level)
            content = Json::array({content});
        return Unseal(Seal(content)).fSoundness;
    };
    EXPECT_EQ(nest(15), Soundness::kSound);
    EXPECT_EQ(nest(16), Soundness::kDamaged);
    EXPECT_EQ(nest(100), Soundness::kDamaged);
}

// Other versions read these files, and find them by these names.
TEST(EnvelopeTest, HasALastingForm)
{
    EXPECT_EQ(MakeDigest("text"), "3430e2aa-a41e-526f-8045-f90e630b80c6");
    const std::string body = "  \"content\": {\n    \"text\": 1\n  }\n}\n";
    EXPECT_EQ(Seal({{"text", 1}}), "{\n  \"format\": 1,\n  \"checksum\": \"" +
                                       MakeDigest("1\n" + body) + "\",\n" + body);
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
