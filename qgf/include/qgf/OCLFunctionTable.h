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

namespace QGF {
namespace OCL {

// An entry point that nothing here calls, so that a library may lack it: the pointer is null then.
// To call one, make it a plain function pointer; it is required from then on.
template <typename Function>
struct Uncalled {
    Function address;
};

struct FunctionTable {
    decltype(&::clGetPlatformIDs) clGetPlatformIDs;
    decltype(&::clGetPlatformInfo) clGetPlatformInfo;
    decltype(&::clGetDeviceIDs) clGetDeviceIDs;
    decltype(&::clGetDeviceInfo) clGetDeviceInfo;
    decltype(&::clCreateContext) clCreateContext;
    Uncalled<decltype(&::clCreateContextFromType)> clCreateContextFromType;
    Uncalled<decltype(&::clRetainContext)> clRetainContext;
    decltype(&::clReleaseContext) clReleaseContext;
    Uncalled<decltype(&::clGetContextInfo)> clGetContextInfo;
    decltype(&::clCreateCommandQueue) clCreateCommandQueue;
    Uncalled<decltype(&::clRetainCommandQueue)> clRetainCommandQueue;
    decltype(&::clReleaseCommandQueue) clReleaseCommandQueue;
    Uncalled<decltype(&::clGetCommandQueueInfo)> clGetCommandQueueInfo;
    Uncalled<decltype(&::clSetCommandQueueProperty)> clSetCommandQueueProperty;
    decltype(&::clCreateBuffer) clCreateBuffer;
    Uncalled<decltype(&::clCreateImage2D)> clCreateImage2D;
    Uncalled<decltype(&::clCreateImage3D)> clCreateImage3D;
    Uncalled<decltype(&::clRetainMemObject)> clRetainMemObject;
    decltype(&::clReleaseMemObject) clReleaseMemObject;
    Uncalled<decltype(&::clGetSupportedImageFormats)> clGetSupportedImageFormats;
    Uncalled<decltype(&::clGetMemObjectInfo)> clGetMemObjectInfo;
    Uncalled<decltype(&::clGetImageInfo)> clGetImageInfo;
    Uncalled<decltype(&::clCreateSampler)> clCreateSampler;
    Uncalled<decltype(&::clRetainSampler)> clRetainSampler;
    Uncalled<decltype(&::clReleaseSampler)> clReleaseSampler;
    Uncalled<decltype(&::clGetSamplerInfo)> clGetSamplerInfo;
    decltype(&::clCreateProgramWithSource) clCreateProgramWithSource;
    Uncalled<decltype(&::clCreateProgramWithBinary)> clCreateProgramWithBinary;
    Uncalled<decltype(&::clRetainProgram)> clRetainProgram;
    Uncalled<decltype(&::clReleaseProgram)> clReleaseProgram;
    decltype(&::clBuildProgram) clBuildProgram;
    Uncalled<decltype(&::clUnloadCompiler)> clUnloadCompiler;
    Uncalled<decltype(&::clGetProgramInfo)> clGetProgramInfo;
    Uncalled<decltype(&::clGetProgramBuildInfo)> clGetProgramBuildInfo;
    decltype(&::clCreateKernel) clCreateKernel;
    Uncalled<decltype(&::clCreateKernelsInProgram)> clCreateKernelsInProgram;
    Uncalled<decltype(&::clRetainKernel)> clRetainKernel;
    Uncalled<decltype(&::clReleaseKernel)> clReleaseKernel;
    decltype(&::clSetKernelArg) clSetKernelArg;
    Uncalled<decltype(&::clGetKernelInfo)> clGetKernelInfo;
    Uncalled<decltype(&::clGetKernelWorkGroupInfo)> clGetKernelWorkGroupInfo;
    decltype(&::clWaitForEvents) clWaitForEvents;
    Uncalled<decltype(&::clGetEventInfo)> clGetEventInfo;
    Uncalled<decltype(&::clRetainEvent)> clRetainEvent;
    decltype(&::clReleaseEvent) clReleaseEvent;
    decltype(&::clGetEventProfilingInfo) clGetEventProfilingInfo;
    Uncalled<decltype(&::clFlush)> clFlush;
    decltype(&::clFinish) clFinish;
    Uncalled<decltype(&::clEnqueueReadBuffer)> clEnqueueReadBuffer;
    Uncalled<decltype(&::clEnqueueWriteBuffer)> clEnqueueWriteBuffer;
    decltype(&::clEnqueueCopyBuffer) clEnqueueCopyBuffer;
    Uncalled<decltype(&::clEnqueueReadImage)> clEnqueueReadImage;
    Uncalled<decltype(&::clEnqueueWriteImage)> clEnqueueWriteImage;
    Uncalled<decltype(&::clEnqueueCopyImage)> clEnqueueCopyImage;
    Uncalled<decltype(&::clEnqueueCopyImageToBuffer)> clEnqueueCopyImageToBuffer;
    Uncalled<decltype(&::clEnqueueCopyBufferToImage)> clEnqueueCopyBufferToImage;
    Uncalled<decltype(&::clEnqueueMapBuffer)> clEnqueueMapBuffer;
    Uncalled<decltype(&::clEnqueueMapImage)> clEnqueueMapImage;
    Uncalled<decltype(&::clEnqueueUnmapMemObject)> clEnqueueUnmapMemObject;
    decltype(&::clEnqueueNDRangeKernel) clEnqueueNDRangeKernel;
    Uncalled<decltype(&::clEnqueueTask)> clEnqueueTask;
    Uncalled<decltype(&::clEnqueueNativeKernel)> clEnqueueNativeKernel;
    Uncalled<decltype(&::clEnqueueMarker)> clEnqueueMarker;
    Uncalled<decltype(&::clEnqueueWaitForEvents)> clEnqueueWaitForEvents;
    Uncalled<decltype(&::clEnqueueBarrier)> clEnqueueBarrier;
    Uncalled<decltype(&::clGetExtensionFunctionAddress)> clGetExtensionFunctionAddress;
};

// Fills the table with what `getProc(context, name)` gives. False if an entry point that is called
// is missing; its member is null then, and the others are filled all the same.
bool FillFunctionTable(FunctionTable& table, Core::Proc (*getProc)(void* context, const char* name),
                       void* context);

} // namespace OCL
} // namespace QGF
