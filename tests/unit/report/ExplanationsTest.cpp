#include <gtest/gtest.h>

#include <set>
#include <stdexcept>
#include <string>

#include "report/Explanations.h"

namespace assay_host {
namespace {

TEST(Explanations, EachKeyHasItsOwn)
{
    std::set<const Explanation*> found;
    for (const KnownKey& key : GetKnownKeys()) {
        const Explanation& explanation = GetExplanation(key);
        EXPECT_EQ(explanation.fKey, key.fKey);
        found.insert(&explanation);
        const std::string meaning = explanation.fMeaning;
        EXPECT_GT(meaning.size(), 20U) << key.fKey;
        EXPECT_EQ(meaning.back(), '.') << key.fKey;
        EXPECT_STRNE(explanation.fSource, "") << key.fKey;
    }
    EXPECT_EQ(found.size(), GetKnownKeys().size());
}

TEST(Explanations, WhatIsMeasuredHasAUnit)
{
    for (const KnownKey& key : GetKnownKeys()) {
        const std::string unit = GetExplanation(key).fUnit;
        switch (key.fForm) {
        case ValueForm::kMebibytes:
            EXPECT_EQ(unit, "MiB") << key.fKey;
            break;
        case ValueForm::kTexels:
            EXPECT_EQ(unit, "texels") << key.fKey;
            break;
        case ValueForm::kBytesPerSecond:
            EXPECT_EQ(unit, "bytes per second") << key.fKey;
            break;
        case ValueForm::kCount:
        case ValueForm::kScore:
            EXPECT_NE(unit, "") << key.fKey;
            break;
        case ValueForm::kFlag:
        case ValueForm::kDate:
        case ValueForm::kId:
        case ValueForm::kAdapter:
            EXPECT_EQ(unit, "") << key.fKey;
            break;
        case ValueForm::kText:
            break;
        }
    }
}

TEST(Explanations, AKeyOutsideTheTableHasNone)
{
    KnownKey key;
    key.fKey = "GLPrice";
    try {
        GetExplanation(key);
        ADD_FAILURE() << "nothing was thrown";
    } catch (const std::logic_error& failure) {
        EXPECT_STREQ(failure.what(), "no explanation of GLPrice");
    }
}

} // namespace
} // namespace assay_host
