// The platforms and devices that a script describes. The driver's first call reads the file that
// ASSAY_SCRIPTED_OPENCL names; without it there is one platform with one GPU.
#pragma once

#include <cstdint>
#include <deque>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "Handles.h"
#include "common/Script.h"

namespace scripted {

// The result of a query for a text or a number.
struct Answer {
    std::string bytes;
    std::optional<std::uint64_t> claim; // the reported size; empty: that of `bytes`
};

using Answers = std::map<std::int64_t, Answer>;

struct Device {
    cl_device_id handle = nullptr; // null for a device whose id is a null pointer
    std::int64_t type = CL_DEVICE_TYPE_GPU;
    Answers answers;
    std::vector<std::int64_t> copyNanoseconds{10000000}; // of the copies, used in turn
    std::vector<std::int64_t> kernelNanoseconds{250000000};
    std::uint64_t clock = 1000000000; // the value of the profiling counters
    bool realTime = false;            // whether clFinish takes as long as the commands
    std::size_t copies = 0;
    std::size_t kernels = 0;
};

struct Platform {
    cl_platform_id handle = nullptr;
    Answers answers;
    std::vector<int> devices; // indices in the model
    std::optional<std::uint32_t> claimedDevices;
};

struct Model {
    // Deques, since handles point to the elements.
    std::deque<Platform> platforms;
    std::deque<Device> devices;
    std::optional<std::uint32_t> claimedPlatforms;
    Monitor monitor;
};

Model& GetModel();

// Returns the number of an OpenCL name that scripts may use instead of a number.
std::optional<std::int64_t> NumberOf(const std::string& name);

} // namespace scripted
