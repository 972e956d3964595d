#include "supervise/linux/Children.h"

#include <csignal>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include "support/Allocations.h"

namespace assay_host {
namespace {

using testing::Contains;
using testing::IsEmpty;
using testing::Key;
using testing::Not;
using testing::Pair;

// /proc also holds "self" and "thread-self", which describe this process, but have no number.
// A signal to the number 0 would reach this process's own group.
TEST(ListChildren, ListsNumberedProcessesOnly)
{
    const std::map<::pid_t, char> siblings = ListChildren(::getppid());
    EXPECT_THAT(siblings, Contains(Pair(::getpid(), 'R')));
    EXPECT_THAT(siblings, Not(Contains(Key(0))));
}

TEST(ListChildren, ListsEndedChildrenUntilTheyAreReaped)
{
    EXPECT_THAT(ListChildren(::getpid()), IsEmpty());
    const ::pid_t child = ::fork();
    ASSERT_GE(child, 0);
    if (child == 0)
        ::_exit(0);
    siginfo_t end = {};
    ASSERT_EQ(::waitid(P_PID, static_cast<id_t>(child), &end, WEXITED | WNOWAIT), 0);
    EXPECT_THAT(ListChildren(::getpid()), testing::ElementsAre(Pair(child, 'Z')));
    ASSERT_EQ(::waitpid(child, nullptr, 0), child);
    EXPECT_THAT(ListChildren(::getpid()), IsEmpty());
}

TEST(ListChildren, LeavesNoDescriptor)
{
    const auto open = [] {
        const int next = ::dup(STDIN_FILENO);
        ::close(next);
        return next;
    };
    const int before = open();
    ListChildren(::getpid());
    EXPECT_EQ(open(), before) << "the lowest free descriptor is another one";
    {
        const assay_test::FailingAllocation failing(0);
        EXPECT_THROW(ListChildren(::getppid()), std::bad_alloc);
    }
    EXPECT_EQ(open(), before) << "when memory is short";
}

} // namespace
} // namespace assay_host
