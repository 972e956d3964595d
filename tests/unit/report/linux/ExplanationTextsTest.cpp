// All texts of the explanations, as a person has read them: tests/data/explanations.txt. With
// ASSAY_WRITE_DATA=1 in the environment the test writes that file, to be read again.
#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>

#include "report/Explanations.h"

namespace assay_host {
namespace {

constexpr char kPath[] = ASSAY_TEST_DATA "/explanations.txt";

std::string Print(const KnownKey& key)
{
    const Explanation& explanation = GetExplanation(key);
    std::string text =
        key.fKey + "\n  " + explanation.fMeaning + "\n  " + explanation.fSource + "\n";
    if (*explanation.fUnit != '\0')
        text += std::string("  ") + explanation.fUnit + "\n";
    return text;
}

TEST(ExplanationTexts, AreThoseThatWereRead)
{
    if (std::getenv("ASSAY_WRITE_DATA") != nullptr) {
        std::ofstream file(kPath);
        for (const KnownKey& key : GetKnownKeys())
            file << Print(key);
    }
    std::ifstream file(kPath);
    std::stringstream all;
    all << file.rdbuf();
    std::string rest = all.str();
    for (const KnownKey& key : GetKnownKeys()) {
        const std::string text = Print(key);
        EXPECT_EQ(rest.substr(0, text.size()), text);
        if (HasFailure())
            return; // all that follows is elsewhere
        rest.erase(0, text.size());
    }
    EXPECT_EQ(rest, "");
}

} // namespace
} // namespace assay_host
