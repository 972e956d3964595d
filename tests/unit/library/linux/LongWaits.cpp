// The library's waits are long in all tests, which then don't depend on the machine's speed. The
// graces for streams stay as they are, because a stream that a descendant holds open ends only by
// them.
#include <gtest/gtest.h>

#include <optional>

#include "supervise/RunTimes.h"
#include "support/Waits.h"

namespace {

class LongWaits : public testing::Environment {
public:
    void SetUp() override
    {
        fShortWait.emplace();
        assay_host::RunTimes& times = assay_host::DefaultRunTimes();
        times.fKillGrace = assay_host::RunTimes::Seconds(pmutil::kLong);
        times.fTreeSeconds = times.fJoinSeconds = pmutil::kLong;
    }
    void TearDown() override { fShortWait.reset(); }

private:
    std::optional<pmutil::LongShortWait> fShortWait;
};

[[maybe_unused]] const testing::Environment* const gLongWaits =
    testing::AddGlobalTestEnvironment(new LongWaits);

} // namespace
