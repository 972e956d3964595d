// The objects of OpenCL handles. The loader finds the entry points by the first member.
#pragma once

#include <cstdint>
#include <string>

#ifndef CL_TARGET_OPENCL_VERSION
#define CL_TARGET_OPENCL_VERSION 120
#endif
#define CL_USE_DEPRECATED_OPENCL_1_0_APIS
#define CL_USE_DEPRECATED_OPENCL_1_1_APIS
#define CL_USE_DEPRECATED_OPENCL_1_2_APIS
#include <CL/cl.h>
#include <CL/cl_icd.h>

namespace scripted {

const cl_icd_dispatch* GetDispatch();

struct Handle {
    const cl_icd_dispatch* dispatch = GetDispatch();
    int number = 0; // counted by kind, in the order of creation
    int device = -1;
};

} // namespace scripted

struct _cl_platform_id : scripted::Handle {};
struct _cl_device_id : scripted::Handle {};
struct _cl_context : scripted::Handle {};
struct _cl_command_queue : scripted::Handle {};
struct _cl_mem : scripted::Handle {
    std::string content;
};
struct _cl_program : scripted::Handle {};
struct _cl_kernel : scripted::Handle {};
struct _cl_event : scripted::Handle {
    std::uint64_t start = 0;
    std::uint64_t end = 0;
};
