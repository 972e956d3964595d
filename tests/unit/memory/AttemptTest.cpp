#include "memory/Attempt.h"

#include <gtest/gtest.h>

#include "Samples.h"

namespace assay_host {
namespace {

TEST(AttemptTest, EndsHaveNames)
{
    for (int end = 0; end <= static_cast<int>(AttemptEnd::kSystemEnded); ++end)
        EXPECT_EQ(ReadAttemptEnd(GetAttemptEndName(static_cast<AttemptEnd>(end))),
                  static_cast<AttemptEnd>(end));
    EXPECT_EQ(ReadAttemptEnd("ende"), std::nullopt);
}

TEST(AttemptTest, KeepsTheLastAttempts)
{
    Knowledge knowledge;
    for (std::size_t count = 0; count < kMaxAttempts + 3; ++count)
        AddAttempt(knowledge,
                   MakeAttempt(kNow + static_cast<std::int64_t>(count), AttemptEnd::kEnded,
                               Usability::kHardware, Usability::kAbsent));
    EXPECT_EQ(knowledge.fAttempts.size(), kMaxAttempts);
    EXPECT_EQ(knowledge.fAttempts.front().fStarted, kNow + 3);
    EXPECT_EQ(knowledge.fCount, kMaxAttempts + 3);
}

TEST(AttemptTest, AnAttemptThatShowedNothingIsReplaced)
{
    Knowledge knowledge;
    const auto add = [&](AttemptEnd end, Usability usability) {
        AddAttempt(knowledge, MakeAttempt(kNow, end, usability, Usability::kUnknown));
    };
    add(AttemptEnd::kCrashed, Usability::kBroken);
    for (std::size_t count = 0; count < kMaxAttempts; ++count) {
        add(AttemptEnd::kStopped, Usability::kUnknown);
        add(AttemptEnd::kNotStarted, Usability::kUnknown);
    }
    EXPECT_EQ(knowledge.fAttempts.size(), 2u);
    add(AttemptEnd::kStopped, Usability::kHardware);
    add(AttemptEnd::kEnded, Usability::kHardware);
    EXPECT_EQ(knowledge.fAttempts.size(), 3u);
}

} // namespace
} // namespace assay_host
