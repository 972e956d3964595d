// The numbers of the interface, which programs that were built before have in them.
#include <gtest/gtest.h>

#include <initializer_list>

#include "assay_host.h"

namespace {

struct Row {
    int fValue;
    int fNumber;
};

void ExpectNumbers(const std::initializer_list<Row>& rows)
{
    for (const Row& row : rows)
        EXPECT_EQ(row.fValue, row.fNumber);
}

TEST(LibraryValues, OfStatuses)
{
    ExpectNumbers({{ASSAY_HOST_OK, 0},
                   {ASSAY_HOST_NO_MEMORY, 1},
                   {ASSAY_HOST_NULL_POINTER, 2},
                   {ASSAY_HOST_BAD_VALUE, 3},
                   {ASSAY_HOST_BAD_TEXT, 4},
                   {ASSAY_HOST_INTERNAL, 5},
                   {ASSAY_HOST_NOT_CHANGED, 6},
                   {ASSAY_HOST_BUSY, 7}});
}

TEST(LibraryValues, OfVerdicts)
{
    ExpectNumbers({{ASSAY_HOST_COMPLETE, 0},
                   {ASSAY_HOST_FAILED_TESTS, 1},
                   {ASSAY_HOST_USAGE_ERROR, 2},
                   {ASSAY_HOST_CRASHED, 3},
                   {ASSAY_HOST_HUNG, 4},
                   {ASSAY_HOST_NEVER_STARTED, 5},
                   {ASSAY_HOST_INTERRUPTED, 6}});
}

TEST(LibraryValues, OfInterfacesAndWhetherTheyCanBeUsed)
{
    ExpectNumbers({{ASSAY_HOST_OPENGL, 0}, {ASSAY_HOST_OPENCL, 1}});
    ExpectNumbers({{ASSAY_HOST_HARDWARE, 0},
                   {ASSAY_HOST_SOFTWARE, 1},
                   {ASSAY_HOST_BROKEN, 2},
                   {ASSAY_HOST_ABSENT, 3},
                   {ASSAY_HOST_UNKNOWN, 4}});
}

TEST(LibraryValues, OfAnswersPlansAndChoices)
{
    ExpectNumbers({{ASSAY_HOST_NOTHING, 0},
                   {ASSAY_HOST_TEXT, 1},
                   {ASSAY_HOST_NUMBER, 2},
                   {ASSAY_HOST_LIST, 3}});
    ExpectNumbers({{ASSAY_HOST_ANSWER, 0}, {ASSAY_HOST_TRY, 1}, {ASSAY_HOST_WAIT, 2}});
    ExpectNumbers({{ASSAY_HOST_MAX_AGE, 0},
                   {ASSAY_HOST_KEEP_ABSENT, 1},
                   {ASSAY_HOST_KEEP_UNKNOWN, 2},
                   {ASSAY_HOST_PAUSE, 3},
                   {ASSAY_HOST_PAUSE_GROWTH, 4},
                   {ASSAY_HOST_RETRIES, 5},
                   {ASSAY_HOST_FORGIVE, 6},
                   {ASSAY_HOST_FORGIVE_FREEZE, 7},
                   {ASSAY_HOST_UNCLEAR, 8},
                   {ASSAY_HOST_UNCLEAR_PAUSE, 9}});
    ExpectNumbers({{ASSAY_HOST_CHOICE_AUTO, 0},
                   {ASSAY_HOST_CHOICE_HARDWARE, 1},
                   {ASSAY_HOST_CHOICE_SOFTWARE, 2},
                   {ASSAY_HOST_CHOICE_ABSENT, 3}});
}

} // namespace
