// Samples with their statistics, worked out by another program: references.py.
#pragma once

#include <cmath>
#include <vector>

#include <gtest/gtest.h>

namespace assay_host {

struct Reference {
    std::vector<double> fFirst;
    std::vector<double> fSecond;
    std::vector<double> fSummary; // of the first: minimum, quartiles, maximum, fences
    double fU;
    double fP;
    bool fIsExact;
};

inline const std::vector<Reference>& GetReferences()
{
    static const std::vector<Reference> references = {
#include "References.inc"
    };
    return references;
}

inline void ExpectClose(double found, double wanted)
{
    EXPECT_NEAR(found, wanted, 1e-12 * std::abs(wanted));
}

} // namespace assay_host
