// Each number of the policy sets one value, and the defaults are those of the header.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include <assay_host.hpp>

#include "library/Options.h"

namespace {

std::vector<std::int64_t> GetAll(const assay_host_options* options)
{
    const assay_host::Policy& policy = options->fRequest.fPolicy;
    return {
        policy.fMaxAge,      policy.fAbsentKept,     policy.fUnknownKept,
        policy.fFirstPause,  policy.fPauseGrowth,    static_cast<std::int64_t>(policy.fRetries),
        policy.fForgiven,    policy.fFreezeForgiven, static_cast<std::int64_t>(policy.fMaxUnclear),
        policy.fUnclearPause};
}

constexpr std::int64_t kDay = 24 * 3600;
const std::vector<std::int64_t> kDefaults = {30 * kDay, 600,      60,        60, 60,
                                             2,         7 * kDay, 30 * kDay, 3,  600};

TEST(LibraryPolicy, EachNumberSetsItsValue)
{
    for (std::size_t which = 0; which < kDefaults.size(); ++which) {
        assay_host_options* const options = assay_host_options_new();
        EXPECT_EQ(GetAll(options), kDefaults);
        EXPECT_EQ(
            assay_host_options_set_policy(options, static_cast<assay_host_policy>(which), 123),
            ASSAY_HOST_OK);
        std::vector<std::int64_t> expected = kDefaults;
        expected[which] = 123;
        EXPECT_EQ(GetAll(options), expected) << which;
        assay_host_options_free(options);
    }
}

TEST(LibraryPolicy, TimesAreWholeSecondsOfAtMostAHundredYears)
{
    assay_host_options* const options = assay_host_options_new();
    assay_host_options_set_policy(options, ASSAY_HOST_PAUSE, 1.9);
    EXPECT_EQ(options->fRequest.fPolicy.fFirstPause, 1);
    assay_host_options_set_policy(options, ASSAY_HOST_PAUSE, 1e300);
    EXPECT_EQ(options->fRequest.fPolicy.fFirstPause, 100 * 365 * kDay);
    assay_host_options_set_wait(options, 1e300);
    EXPECT_EQ(options->fRequest.fWaitSeconds, 100.0 * 365 * kDay);
    assay_host_options_free(options);
}

TEST(LibraryPolicy, TheWrapperPassesEachValue)
{
    assay::Options options;
    assay::Policy& policy = options.policy;
    policy = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10};
    assay_host_options* const made = assay_host_options_new();
    assay::detail::set_advice_options(made, options);
    EXPECT_EQ(GetAll(made), (std::vector<std::int64_t>{1, 2, 3, 4, 5, 6, 7, 8, 9, 10}));
    policy = {};
    assay::detail::set_advice_options(made, options);
    EXPECT_EQ(GetAll(made), kDefaults);
    assay_host_options_free(made);
}

} // namespace
