// OpenCL's entry points as one plain struct, in the order in which the OpenCL 1.0 header declares
// them. Those that are called are plain pointers to functions, never null in the library's own
// table.
#pragma once

#ifndef CL_TARGET_OPENCL_VERSION
#define CL_TARGET_OPENCL_VERSION 110
#endif
#define CL_USE_DEPRECATED_OPENCL_1_0_APIS
#define CL_USE_DEPRECATED_OPENCL_1_1_APIS
#include <CL/cl.h>

#include "qgf/Core.h"

// OpenCL's entry points, one a line, in the order in which the OpenCL 1.0 header declares them. The
// two parameters are macros that take a name: CALLED for the entry points that are called, which a
// library must have, UNCALLED for the others. To call one of those, make it CALLED; it is required
// from then on.
#define QGF_OCL_ENTRY_POINTS(CALLED, UNCALLED)                                                     \
    CALLED(clGetPlatformIDs)                                                                       \
    CALLED(clGetPlatformInfo)                                                                      \
    CALLED(clGetDeviceIDs)                                                                         \
    CALLED(clGetDeviceInfo)                                                                        \
    CALLED(clCreateContext)                                                                        \
    UNCALLED(clCreateContextFromType)                                                              \
    UNCALLED(clRetainContext)                                                                      \
    CALLED(clReleaseContext)                                                                       \
    UNCALLED(clGetContextInfo)                                                                     \
    CALLED(clCreateCommandQueue)                                                                   \
    UNCALLED(clRetainCommandQueue)                                                                 \
    CALLED(clReleaseCommandQueue)                                                                  \
    UNCALLED(clGetCommandQueueInfo)                                                                \
    UNCALLED(clSetCommandQueueProperty)                                                            \
    CALLED(clCreateBuffer)                                                                         \
    UNCALLED(clCreateImage2D)                                                                      \
    UNCALLED(clCreateImage3D)                                                                      \
    UNCALLED(clRetainMemObject)                                                                    \
    CALLED(clReleaseMemObject)                                                                     \
    UNCALLED(clGetSupportedImageFormats)                                                           \
    UNCALLED(clGetMemObjectInfo)                                                                   \
    UNCALLED(clGetImageInfo)                                                                       \
    UNCALLED(clCreateSampler)                                                                      \
    UNCALLED(clRetainSampler)                                                                      \
    UNCALLED(clReleaseSampler)                                                                     \
    UNCALLED(clGetSamplerInfo)                                                                     \
    CALLED(clCreateProgramWithSource)                                                              \
    UNCALLED(clCreateProgramWithBinary)                                                            \
    UNCALLED(clRetainProgram)                                                                      \
    UNCALLED(clReleaseProgram)                                                                     \
    CALLED(clBuildProgram)                                                                         \
    UNCALLED(clUnloadCompiler)                                                                     \
    UNCALLED(clGetProgramInfo)                                                                     \
    UNCALLED(clGetProgramBuildInfo)                                                                \
    CALLED(clCreateKernel)                                                                         \
    UNCALLED(clCreateKernelsInProgram)                                                             \
    UNCALLED(clRetainKernel)                                                                       \
    UNCALLED(clReleaseKernel)                                                                      \
    CALLED(clSetKernelArg)                                                                         \
    UNCALLED(clGetKernelInfo)                                                                      \
    UNCALLED(clGetKernelWorkGroupInfo)                                                             \
    CALLED(clWaitForEvents)                                                                        \
    UNCALLED(clGetEventInfo)                                                                       \
    UNCALLED(clRetainEvent)                                                                        \
    CALLED(clReleaseEvent)                                                                         \
    CALLED(clGetEventProfilingInfo)                                                                \
    UNCALLED(clFlush)                                                                              \
    CALLED(clFinish)                                                                               \
    UNCALLED(clEnqueueReadBuffer)                                                                  \
    UNCALLED(clEnqueueWriteBuffer)                                                                 \
    CALLED(clEnqueueCopyBuffer)                                                                    \
    UNCALLED(clEnqueueReadImage)                                                                   \
    UNCALLED(clEnqueueWriteImage)                                                                  \
    UNCALLED(clEnqueueCopyImage)                                                                   \
    UNCALLED(clEnqueueCopyImageToBuffer)                                                           \
    UNCALLED(clEnqueueCopyBufferToImage)                                                           \
    UNCALLED(clEnqueueMapBuffer)                                                                   \
    UNCALLED(clEnqueueMapImage)                                                                    \
    UNCALLED(clEnqueueUnmapMemObject)                                                              \
    CALLED(clEnqueueNDRangeKernel)                                                                 \
    UNCALLED(clEnqueueTask)                                                                        \
    UNCALLED(clEnqueueNativeKernel)                                                                \
    UNCALLED(clEnqueueMarker)                                                                      \
    UNCALLED(clEnqueueWaitForEvents)                                                               \
    UNCALLED(clEnqueueBarrier)                                                                     \
    UNCALLED(clGetExtensionFunctionAddress)

namespace QGF {
namespace OCL {

// An entry point that nothing here calls, so that a library may lack it: the pointer is null then.
template <typename Function>
struct Uncalled {
    Function address;
};

struct FunctionTable {
#define QGF_OCL_CALLED(name) decltype(&::name) name;             // NOLINT(*-macro-parentheses)
#define QGF_OCL_UNCALLED(name) Uncalled<decltype(&::name)> name; // NOLINT(*-macro-parentheses)
    QGF_OCL_ENTRY_POINTS(QGF_OCL_CALLED, QGF_OCL_UNCALLED)
#undef QGF_OCL_CALLED
#undef QGF_OCL_UNCALLED
};

// Fills the table with what `getProc(context, name)` gives. False if an entry point that is called
// is missing; its member is null then, and the others are filled all the same.
bool FillFunctionTable(FunctionTable& table, Core::Proc (*getProc)(void* context, const char* name),
                       void* context);

} // namespace OCL
} // namespace QGF
