// The ioctls need no other right than to open the render node (DRM_RENDER_ALLOW in the tables of
// i915_driver.c, xe_device.c, radeon_drv.c and nouveau_drm.c of Linux 6.12) and return figures that
// the driver has stored. But they wake a suspended card: radeon_driver_open_kms and
// nouveau_drm_open resume it when the node is opened, xe_drm_ioctl at every ioctl, and
// i915_gem_open sets up page tables, on a discrete card in its own memory.
//
// libdrm's headers supply the structures. Its drmIoctl isn't used: it adds only the retry of an
// interrupted call.
#include "linux/gpu/DrmQuery.h"

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <iterator>

#include <drm.h>
#include <fcntl.h>
#include <i915_drm.h>
#include <radeon_drm.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include "linux/gpu/DriverStructures.h"
#include "qgf/SystemFiles.h"

namespace pmutil {
namespace {

// Bytes; enough for 46 regions. A recorded answer is read from a file of at most this size.
constexpr std::size_t kMaxAnswerSize = QGF::kMaxSystemFileSize;
constexpr int kMaxTries = 16;

class Node {
public:
    Node(const DrmCalls& calls, const std::string& name)
        : fCalls(calls), fNode(calls.open(("/dev/dri/" + name).c_str()))
    {}
    ~Node()
    {
        if (fNode >= 0)
            fCalls.close(fNode);
    }
    Node(const Node&) = delete;
    Node& operator=(const Node&) = delete;

    // Repeats a call that fails with EINTR or EAGAIN, at most kMaxTries times.
    bool ioctl(unsigned long request, void* argument) const
    {
        for (int i = 0; fNode >= 0 && i != kMaxTries; ++i) {
            if (fCalls.ioctl(fNode, request, argument) >= 0)
                return true;
            if (errno != EINTR && errno != EAGAIN)
                break;
        }
        return false;
    }

private:
    const DrmCalls& fCalls;
    const int fNode;
};

std::uint64_t AddressOf(void* data)
{
    return reinterpret_cast<std::uintptr_t>(data);
}

template <typename Argument>
std::string Bytes(const Argument& argument)
{
    return std::string(reinterpret_cast<const char*>(&argument), sizeof argument);
}

// The first call returns the length, the second the data. A second length that differs from the
// first is a failure.
std::string QueryI915(const Node& node)
{
    drm_i915_query_item item{};
    item.query_id = DRM_I915_QUERY_MEMORY_REGIONS;
    drm_i915_query query{};
    query.num_items = 1;
    query.items_ptr = AddressOf(&item);
    if (!node.ioctl(DRM_IOCTL_I915_QUERY, &query) || item.length <= 0 ||
        static_cast<std::size_t>(item.length) > kMaxAnswerSize)
        return std::string();
    std::string answer(static_cast<std::size_t>(item.length), '\0');
    item.data_ptr = AddressOf(answer.data());
    const std::int32_t length = item.length;
    return node.ioctl(DRM_IOCTL_I915_QUERY, &query) && item.length == length ? answer
                                                                             : std::string();
}

std::string QueryXe(const Node& node)
{
    XeDeviceQuery query{};
    query.query = kXeQueryMemRegions;
    if (!node.ioctl(kXeIoctlDeviceQuery, &query) || query.size == 0 || query.size > kMaxAnswerSize)
        return std::string();
    std::string answer(query.size, '\0');
    query.data = AddressOf(answer.data());
    return node.ioctl(kXeIoctlDeviceQuery, &query) && query.size == answer.size() ? answer
                                                                                  : std::string();
}

std::string QueryRadeon(const Node& node)
{
    drm_radeon_gem_info info{};
    return node.ioctl(DRM_IOCTL_RADEON_GEM_INFO, &info) ? Bytes(info) : std::string();
}

std::string QueryNouveau(const Node& node)
{
    NouveauParameter parameter{};
    parameter.param = kNouveauFbSize;
    return node.ioctl(kNouveauIoctlGetParam, &parameter) ? Bytes(parameter) : std::string();
}

struct Query {
    const char* driver;
    std::string (*run)(const Node& node);
};

constexpr Query kQueries[] = {
    {"i915", QueryI915},
    {"xe", QueryXe},
    {"radeon", QueryRadeon},
    {"nouveau", QueryNouveau},
};

const Query* FindQuery(const std::string& driver)
{
    const auto* const query =
        std::find_if(std::begin(kQueries), std::end(kQueries),
                     [&](const Query& candidate) { return candidate.driver == driver; });
    return query == std::end(kQueries) ? nullptr : query;
}

} // namespace

const DrmCalls& SystemDrmCalls()
{
    static const DrmCalls gCalls = {
        [](const char* path) { return ::open(path, O_RDWR | O_CLOEXEC | O_NONBLOCK | O_NOCTTY); },
        [](int node, unsigned long request, void* argument) {
            return ::ioctl(node, request, argument);
        },
        [](int node) { ::close(node); }};
    return gCalls;
}

bool HasDrmQuery(const std::string& driver)
{
    return FindQuery(driver) != nullptr;
}

std::string QueryDrmNode(const DrmCalls& calls, const std::string& node, const std::string& driver)
{
    const Query* const query = FindQuery(driver);
    return query != nullptr ? query->run(Node(calls, node)) : std::string();
}

std::string QueryDrmNode(const std::string& node, const std::string& driver)
{
    if (QGF::SystemRoot().empty())
        return QueryDrmNode(SystemDrmCalls(), node, driver);
    std::string answer;
    QGF::ReadSystemFile("/dev/dri/" + node + "." + driver, answer);
    return answer;
}

} // namespace pmutil
