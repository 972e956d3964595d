// The names of errors, verdicts, usabilities and plans.
#include <gtest/gtest.h>

#include <iterator>

#include <assay_host.h>

namespace {

template <typename Enumeration, std::size_t kSize>
void ExpectNames(const char* (*name)(Enumeration), const char* const (&names)[kSize])
{
    for (std::size_t index = 0; index < kSize; ++index)
        EXPECT_STREQ(name(static_cast<Enumeration>(index)), names[index]) << index;
}

TEST(LibraryNames, OfErrors)
{
    ExpectNames(assay_host_error_text,
                {"no error", "out of memory", "a pointer is null", "a value is out of its range",
                 "a text is empty", "the system refused a thread or another resource",
                 "the state can't be changed", "another process or thread makes an attempt",
                 "unknown error", "unknown error"});
}

TEST(LibraryNames, OfVerdicts)
{
    ExpectNames(assay_host_verdict_name, {"complete", "failed-tests", "usage-error", "crashed",
                                          "hung", "never-started", "interrupted", "unknown"});
}

TEST(LibraryNames, OfUsabilities)
{
    ExpectNames(assay_host_usability_name, {"hardware", "software", "broken", "absent", "unknown"});
}

TEST(LibraryNames, OfPlans)
{
    ExpectNames(assay_host_plan_name, {"answer", "try", "wait", "unknown"});
}

} // namespace
