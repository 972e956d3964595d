// The OpenCL entry points as a struct of function pointers.
#pragma once

#ifndef CL_TARGET_OPENCL_VERSION
#define CL_TARGET_OPENCL_VERSION 110
#endif
#define CL_USE_DEPRECATED_OPENCL_1_0_APIS
#define CL_USE_DEPRECATED_OPENCL_1_1_APIS
#include <CL/cl.h>

#include "qgf/Core.h"

// The entry points in the order of the OpenCL 1.0 header. The two parameters are macros that take a
// name: CALLED for the entry points that are called and that a library must have, UNCALLED for the
// others. To call one of the others, make it CALLED; it is then required.
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

// An entry point that nothing here calls. Null if the library lacks it.
template <typename Function>
struct Uncalled {
    Function address;
};

// CALLED members are plain function pointers, never null in the library's own table.
struct FunctionTable {
#define QGF_OCL_CALLED(name) decltype(&::name) name;             // NOLINT(*-macro-parentheses)
#define QGF_OCL_UNCALLED(name) Uncalled<decltype(&::name)> name; // NOLINT(*-macro-parentheses)
    QGF_OCL_ENTRY_POINTS(QGF_OCL_CALLED, QGF_OCL_UNCALLED)
#undef QGF_OCL_CALLED
#undef QGF_OCL_UNCALLED
};

// Fills the table from `getProc(context, name)`. Returns false if a CALLED entry point is missing;
// its member is then null, and the other members are filled.
bool FillFunctionTable(FunctionTable& table, Core::Proc (*getProc)(void* context, const char* name),
                       void* context);

// Makes the calls of the CALLED functions observed, as in DriverCall.h. Only for the one table of a
// process.
void ObserveCalls(FunctionTable& table);

} // namespace OCL
} // namespace QGF
