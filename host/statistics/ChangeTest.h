// Decides whether two series of a measurement differ by more than their noise.
#pragma once

#include <vector>

#include "statistics/RankTest.h"

namespace assay_host {

// The probability that two series of the same distribution are called different is at most this.
constexpr double kChangeLevel = 0.01;

enum class Change {
    kTooFew, // even samples that don't overlap would not show a difference at the level
    kNoise,  // what differs may be noise
    kChange  // the difference is larger than the noise
};

struct ChangeTest {
    Change fChange = Change::kTooFew;
    RankTest fRanks{}; // with kTooFew only if neither sample is empty
};

// Tests two samples, which may be empty. All values must be finite. Any thread may call.
ChangeTest TestChange(const std::vector<double>& before, const std::vector<double>& after);

} // namespace assay_host
