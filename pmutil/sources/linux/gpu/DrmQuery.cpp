// Which ioctls are used: each is open to whoever may open the render node (DRM_RENDER_ALLOW in the
// tables of i915_driver.c, xe_device.c, radeon_drv.c and nouveau_drm.c of Linux 6.12) and gives
// figures that the driver keeps. But taking the answer wakes a sleeping card:
// radeon_driver_open_kms and nouveau_drm_open resume it when the node is opened, xe_drm_ioctl at
// every ioctl, and i915_gem_open sets up page tables, on a discrete card in its own memory.
//
// libdrm gives the structures at compile time. Its drmIoctl would only repeat an interrupted call.
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

constexpr std::size_t kAnswerLimit = QGF::kMaxSystemFileSize; // bytes; room for 46 regions
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

    // Kernel and driver may break a call off for it to be made again.
    bool ask(unsigned long request, void* argument) const
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

// The driver first says how much there is to tell, then tells it. A second length that differs is
// no answer.
std::string AskI915(const Node& node)
{
    drm_i915_query_item item{};
    item.query_id = DRM_I915_QUERY_MEMORY_REGIONS;
    drm_i915_query query{};
    query.num_items = 1;
    query.items_ptr = AddressOf(&item);
    if (!node.ask(DRM_IOCTL_I915_QUERY, &query) || item.length <= 0 ||
        static_cast<std::size_t>(item.length) > kAnswerLimit)
        return std::string();
    std::string answer(static_cast<std::size_t>(item.length), '\0');
    item.data_ptr = AddressOf(answer.data());
    const std::int32_t length = item.length;
    return node.ask(DRM_IOCTL_I915_QUERY, &query) && item.length == length ? answer : std::string();
}

std::string AskXe(const Node& node)
{
    XeDeviceQuery query{};
    query.query = kXeQueryMemRegions;
    if (!node.ask(kXeIoctlDeviceQuery, &query) || query.size == 0 || query.size > kAnswerLimit)
        return std::string();
    std::string answer(query.size, '\0');
    query.data = AddressOf(answer.data());
    return node.ask(kXeIoctlDeviceQuery, &query) && query.size == answer.size() ? answer
                                                                                : std::string();
}

std::string AskRadeon(const Node& node)
{
    drm_radeon_gem_info info{};
    return node.ask(DRM_IOCTL_RADEON_GEM_INFO, &info) ? Bytes(info) : std::string();
}

std::string AskNouveau(const Node& node)
{
    NouveauParameter parameter{};
    parameter.param = kNouveauFbSize;
    return node.ask(kNouveauIoctlGetParam, &parameter) ? Bytes(parameter) : std::string();
}

struct Question {
    const char* driver;
    std::string (*ask)(const Node& node);
};

constexpr Question kQuestions[] = {
    {"i915", AskI915},
    {"xe", AskXe},
    {"radeon", AskRadeon},
    {"nouveau", AskNouveau},
};

const Question* QuestionFor(const std::string& driver)
{
    const auto* const question =
        std::find_if(std::begin(kQuestions), std::end(kQuestions),
                     [&](const Question& candidate) { return candidate.driver == driver; });
    return question == std::end(kQuestions) ? nullptr : question;
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

bool AnswersOnDrmNode(const std::string& driver)
{
    return QuestionFor(driver) != nullptr;
}

std::string AskDrmNode(const DrmCalls& calls, const std::string& node, const std::string& driver)
{
    const Question* const question = QuestionFor(driver);
    return question != nullptr ? question->ask(Node(calls, node)) : std::string();
}

std::string AskDrmNode(const std::string& node, const std::string& driver)
{
    if (QGF::SystemRoot().empty())
        return AskDrmNode(SystemDrmCalls(), node, driver);
    std::string answer;
    QGF::ReadSystemFile("/dev/dri/" + node + "." + driver, answer);
    return answer;
}

} // namespace pmutil
