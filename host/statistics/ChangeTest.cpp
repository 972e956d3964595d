#include "statistics/ChangeTest.h"

namespace assay_host {

ChangeTest TestChange(const std::vector<double>& before, const std::vector<double>& after)
{
    ChangeTest test;
    if (before.empty() || after.empty())
        return test;
    test.fRanks = TestRanks(before, after);
    if (GetSmallestP(before.size(), after.size()) > kChangeLevel)
        return test;
    test.fChange = test.fRanks.fP <= kChangeLevel ? Change::kChange : Change::kNoise;
    return test;
}

} // namespace assay_host
