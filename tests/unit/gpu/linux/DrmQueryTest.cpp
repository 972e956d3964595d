// The queries against a fake kernel that behaves like the real drivers.
#include "linux/gpu/DrmQuery.h"

#include <cerrno>
#include <cstring>

#include <drm.h>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <i915_drm.h>
#include <radeon_drm.h>

#include "linux/gpu/DriverStructures.h"
#include "qgf/SystemFiles.h"
#include "support/AdapterTree.h"

namespace pmutil {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

// The state of the fake kernel and the recorded calls.
struct Kernel {
    int node = 7;     // -1: none opens
    int failures = 0; // the number of next calls that fail with `error`
    int error = EINTR;
    std::string answer;
    std::string secondary; // the answer to the second call; empty: the same
    std::vector<std::string> opened;
    int ioctls = 0;
    int closed = 0;
};
Kernel gKernel;

int Open(const char* path)
{
    gKernel.opened.emplace_back(path);
    return gKernel.node;
}

const std::string& NextAnswer(bool again)
{
    return again && !gKernel.secondary.empty() ? gKernel.secondary : gKernel.answer;
}

// Like query_memregion_info: a length of 0 queries the length; a failure is a negative length.
int AnswerI915(void* argument)
{
    auto* query = static_cast<drm_i915_query*>(argument);
    EXPECT_EQ(query->num_items, 1U);
    EXPECT_EQ(query->flags, 0U);
    auto* item = reinterpret_cast<drm_i915_query_item*>(query->items_ptr);
    EXPECT_EQ(item->query_id, std::uint64_t{DRM_I915_QUERY_MEMORY_REGIONS});
    EXPECT_EQ(item->flags, 0U);
    const std::string& answer = NextAnswer(item->length != 0);
    const auto length = static_cast<std::int32_t>(answer.size());
    if (item->length == 0) {
        item->length = length == 0 ? -EINVAL : length;
    } else if (item->length < length) {
        item->length = -EINVAL;
    } else {
        std::memcpy(reinterpret_cast<void*>(item->data_ptr), answer.data(), answer.size());
        item->length = length;
    }
    return 0;
}

// Like query_mem_regions: a size of 0 queries the size; any other must equal it.
int AnswerXe(void* argument)
{
    auto* query = static_cast<XeDeviceQuery*>(argument);
    EXPECT_EQ(query->extensions, 0U);
    EXPECT_EQ(query->query, 1U);
    const std::string& answer = NextAnswer(query->size != 0);
    if (query->size == 0) {
        query->size = static_cast<std::uint32_t>(answer.size());
        return 0;
    }
    if (query->size != answer.size()) {
        errno = EINVAL;
        return -1;
    }
    std::memcpy(reinterpret_cast<void*>(query->data), answer.data(), answer.size());
    return 0;
}

int AnswerInPlace(void* argument, std::size_t size)
{
    if (gKernel.answer.size() != size) {
        errno = EINVAL;
        return -1;
    }
    std::memcpy(argument, gKernel.answer.data(), size);
    return 0;
}

int Ioctl(int node, unsigned long request, void* argument)
{
    EXPECT_EQ(node, gKernel.node);
    ++gKernel.ioctls;
    if (gKernel.failures > 0) {
        --gKernel.failures;
        errno = gKernel.error;
        return -1;
    }
    switch (request) {
    case DRM_IOCTL_I915_QUERY:
        return AnswerI915(argument);
    case DRM_IOWR(DRM_COMMAND_BASE + 0x00, XeDeviceQuery):
        return AnswerXe(argument);
    case DRM_IOCTL_RADEON_GEM_INFO:
        return AnswerInPlace(argument, sizeof(drm_radeon_gem_info));
    case DRM_IOWR(DRM_COMMAND_BASE + 0x00, NouveauParameter):
        EXPECT_EQ(static_cast<NouveauParameter*>(argument)->param, 8U);
        return AnswerInPlace(argument, sizeof(NouveauParameter));
    default:
        errno = ENOTTY;
        return -1;
    }
}

void Close(int node)
{
    EXPECT_EQ(node, gKernel.node);
    ++gKernel.closed;
}

constexpr DrmCalls kCalls = {Open, Ioctl, Close};

std::string Ask(const std::string& driver)
{
    return QueryDrmNode(kCalls, "renderD128", driver);
}

class DrmQueryTest : public ::testing::TestWithParam<std::pair<const char*, std::size_t>> {
protected:
    DrmQueryTest()
    {
        gKernel = Kernel();
        for (std::size_t i = 0; i != GetParam().second; ++i)
            gKernel.answer += static_cast<char>(i + 1);
    }
    const char* driver() const { return GetParam().first; }
};

TEST_P(DrmQueryTest, TheAnswerIsReturnedUnchanged)
{
    EXPECT_TRUE(HasDrmQuery(driver()));
    EXPECT_EQ(Ask(driver()), gKernel.answer);
    EXPECT_THAT(gKernel.opened, ElementsAre("/dev/dri/renderD128"));
    EXPECT_EQ(gKernel.closed, 1);
}

// A host may start this program without standard input.
TEST_P(DrmQueryTest, ANodeMayHaveTheNumberOfStandardInput)
{
    gKernel.node = 0;
    EXPECT_EQ(Ask(driver()), gKernel.answer);
    EXPECT_EQ(gKernel.closed, 1);
}

TEST_P(DrmQueryTest, ANodeThatCannotBeOpenedIsEmpty)
{
    gKernel.node = -1;
    EXPECT_EQ(Ask(driver()), "");
    EXPECT_EQ(gKernel.ioctls, 0);
    EXPECT_EQ(gKernel.closed, 0);
}

TEST_P(DrmQueryTest, AnInterruptedCallIsRepeated)
{
    gKernel.failures = 2;
    EXPECT_EQ(Ask(driver()), gKernel.answer);
    gKernel.failures = 2;
    gKernel.error = EAGAIN;
    EXPECT_EQ(Ask(driver()), gKernel.answer);
}

TEST_P(DrmQueryTest, AnInterruptedCallIsRepeatedAtMost16Times)
{
    gKernel.failures = 1000;
    EXPECT_EQ(Ask(driver()), "");
    EXPECT_EQ(gKernel.ioctls, 16);
    gKernel.failures = 15;
    EXPECT_EQ(Ask(driver()), gKernel.answer);
}

TEST_P(DrmQueryTest, AFailureIsEmpty)
{
    gKernel.failures = 1;
    gKernel.error = EACCES;
    EXPECT_EQ(Ask(driver()), "");
    EXPECT_EQ(gKernel.ioctls, 1);
    EXPECT_EQ(gKernel.closed, 1);
}

TEST_P(DrmQueryTest, AnEmptyAnswerIsEmpty)
{
    gKernel.answer.clear();
    EXPECT_EQ(Ask(driver()), "");
}

TEST_P(DrmQueryTest, AnAnswerAboveTheLimitIsEmpty)
{
    gKernel.answer = std::string(100000, 'x');
    EXPECT_EQ(Ask(driver()), "");
}

INSTANTIATE_TEST_SUITE_P(Drivers, DrmQueryTest,
                         ::testing::Values(std::make_pair("i915", std::size_t{16 + 2 * 88}),
                                           std::make_pair("xe", std::size_t{8 + 2 * 88}),
                                           std::make_pair("radeon", std::size_t{24}),
                                           std::make_pair("nouveau", std::size_t{16})));

TEST(DrmQueriesTest, AnAnswerThatChangesBetweenTheCallsIsEmpty)
{
    for (const char* driver : {"i915", "xe"}) {
        gKernel = Kernel();
        gKernel.answer = std::string(200, 'x');
        for (const std::size_t length : {std::size_t{100}, std::size_t{300}}) {
            gKernel.secondary = std::string(length, 'y');
            EXPECT_EQ(Ask(driver), "") << driver << length;
        }
    }
}

TEST(DrmQueriesTest, AnAnswerMayBeAsLargeAsARecordedOne)
{
    for (const char* driver : {"i915", "xe"}) {
        gKernel = Kernel();
        gKernel.answer = std::string(QGF::kMaxSystemFileSize, 'x');
        EXPECT_EQ(Ask(driver), gKernel.answer) << driver;
        gKernel.answer += 'x';
        EXPECT_EQ(Ask(driver), "") << driver;
    }
}

TEST(DrmQueriesTest, TheSystemsCallsReachTheFile)
{
    const DrmCalls& calls = SystemDrmCalls();
    EXPECT_EQ(calls.open("/no/such/node"), -1);
    EXPECT_EQ(errno, ENOENT);
    const int node = calls.open("/dev/null");
    ASSERT_GE(node, 0);
    EXPECT_EQ(::fcntl(node, F_GETFD), FD_CLOEXEC);
    EXPECT_EQ(::fcntl(node, F_GETFL) & (O_ACCMODE | O_NONBLOCK), O_RDWR | O_NONBLOCK);
    EXPECT_EQ(calls.ioctl(node, DRM_IOCTL_RADEON_GEM_INFO, nullptr), -1);
    EXPECT_EQ(errno, ENOTTY);
    calls.close(node);
    EXPECT_EQ(::fcntl(node, F_GETFD), -1);
}

TEST(DrmQueriesTest, OtherDriversAreNotQueried)
{
    gKernel = Kernel();
    for (const char* driver : {"", "amdgpu", "nvidia", "i9155"}) {
        EXPECT_FALSE(HasDrmQuery(driver));
        EXPECT_EQ(Ask(driver), "");
    }
    EXPECT_THAT(gKernel.opened, IsEmpty());
}

TEST(DrmQueriesTest, ARecordedMachinesAnswerIsReadFromAFile)
{
    const AdapterTree tree("empty");
    EXPECT_EQ(QueryDrmNode("renderD128", "i915"), "");
    tree.write("/dev/dri/renderD128.i915", std::string("a\0b", 3));
    EXPECT_EQ(QueryDrmNode("renderD128", "i915"), std::string("a\0b", 3));
    EXPECT_EQ(QueryDrmNode("renderD128", "xe"), "");
}

} // namespace
} // namespace pmutil
