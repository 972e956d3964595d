// The list of all that is stored, with what can't be read.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "FakeFolder.h"
#include "Samples.h"
#include "memory/Envelope.h"
#include "memory/Store.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class StoreListTest : public testing::Test {
protected:
    StoreListTest() { fStore.Save(MakeKnowledge(), kNow); }

    // Returns the problem of the only entry.
    std::string ListProblem()
    {
        const auto list = fStore.List();
        if (list.size() != 1)
            return std::to_string(list.size()) + " entries";
        EXPECT_EQ(list[0].fKnowledge.has_value(), list[0].fProblem.empty());
        return list[0].fProblem;
    }

    FakeFolder fFolder;
    Store fStore{fFolder};
};

TEST_F(StoreListTest, HasWhatWasSaved)
{
    EXPECT_EQ(ListProblem(), "");
}

TEST_F(StoreListTest, HasTheProblemOfADamagedFile)
{
    fFolder.GetState()[30] ^= 1;
    EXPECT_EQ(ListProblem(), "it is damaged");
}

TEST_F(StoreListTest, HasTheProblemOfAWholeFileOfSomethingElse)
{
    fFolder.GetState() = Seal({{"no", "knowledge"}});
    EXPECT_EQ(ListProblem(), "it is damaged");
}

TEST_F(StoreListTest, HasTheProblemOfALargeFile)
{
    fFolder.GetState().append(kMaxStateBytes, ' ');
    EXPECT_EQ(ListProblem(), "it is too large");
}

} // namespace
} // namespace assay_host
