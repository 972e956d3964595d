// The platforms and devices that a script describes. Read once, at the driver's first call, from
// the file that ASSAY_SCRIPTED_OPENCL names; without that there is one platform with one GPU.
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

// What a question for a text or a number is answered with.
struct Answer {
    std::string bytes;
    std::optional<std::uint64_t> claim; // the size that is told in place of the bytes' own
};

using Answers = std::map<std::int64_t, Answer>;

struct Device {
    cl_device_id handle = nullptr; // null for a device whose id is a null pointer
    std::int64_t type = CL_DEVICE_TYPE_GPU;
    Answers answers;
    std::vector<std::int64_t> copyNanoseconds{10000000}; // of one copy after the other, in turns
    std::vector<std::int64_t> kernelNanoseconds{250000000};
    std::uint64_t clock = 1000000000; // what its counters show
    bool realTime = false;            // whether clFinish takes as long as the commands
    std::size_t copies = 0;
    std::size_t kernels = 0;
};

struct Platform {
    cl_platform_id handle = nullptr;
    Answers answers;
    std::vector<int> devices; // numbers in the model
    std::optional<std::uint32_t> claimedDevices;
};

struct Model {
    // Handles point into these.
    std::deque<Platform> platforms;
    std::deque<Device> devices;
    std::optional<std::uint32_t> claimedPlatforms;
    Monitor monitor;
};

Model& TheModel();

// The number of an OpenCL name that scripts may use in the place of a number.
std::optional<std::int64_t> NumberOf(const std::string& name);

} // namespace scripted
