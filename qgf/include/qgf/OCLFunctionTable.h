// OpenCL's entry points as one plain struct, in the order in which the OpenCL 1.0 header declares
// them.
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

struct FunctionTable {
    decltype(&::clGetPlatformIDs) clGetPlatformIDs;
    decltype(&::clGetPlatformInfo) clGetPlatformInfo;
    decltype(&::clGetDeviceIDs) clGetDeviceIDs;
    decltype(&::clGetDeviceInfo) clGetDeviceInfo;
    decltype(&::clCreateContext) clCreateContext;
    decltype(&::clCreateContextFromType) clCreateContextFromType;
    decltype(&::clRetainContext) clRetainContext;
    decltype(&::clReleaseContext) clReleaseContext;
    decltype(&::clGetContextInfo) clGetContextInfo;
    decltype(&::clCreateCommandQueue) clCreateCommandQueue;
    decltype(&::clRetainCommandQueue) clRetainCommandQueue;
    decltype(&::clReleaseCommandQueue) clReleaseCommandQueue;
    decltype(&::clGetCommandQueueInfo) clGetCommandQueueInfo;
    decltype(&::clSetCommandQueueProperty) clSetCommandQueueProperty;
    decltype(&::clCreateBuffer) clCreateBuffer;
    decltype(&::clCreateImage2D) clCreateImage2D;
    decltype(&::clCreateImage3D) clCreateImage3D;
    decltype(&::clRetainMemObject) clRetainMemObject;
    decltype(&::clReleaseMemObject) clReleaseMemObject;
    decltype(&::clGetSupportedImageFormats) clGetSupportedImageFormats;
    decltype(&::clGetMemObjectInfo) clGetMemObjectInfo;
    decltype(&::clGetImageInfo) clGetImageInfo;
    decltype(&::clCreateSampler) clCreateSampler;
    decltype(&::clRetainSampler) clRetainSampler;
    decltype(&::clReleaseSampler) clReleaseSampler;
    decltype(&::clGetSamplerInfo) clGetSamplerInfo;
    decltype(&::clCreateProgramWithSource) clCreateProgramWithSource;
    decltype(&::clCreateProgramWithBinary) clCreateProgramWithBinary;
    decltype(&::clRetainProgram) clRetainProgram;
    decltype(&::clReleaseProgram) clReleaseProgram;
    decltype(&::clBuildProgram) clBuildProgram;
    decltype(&::clUnloadCompiler) clUnloadCompiler;
    decltype(&::clGetProgramInfo) clGetProgramInfo;
    decltype(&::clGetProgramBuildInfo) clGetProgramBuildInfo;
    decltype(&::clCreateKernel) clCreateKernel;
    decltype(&::clCreateKernelsInProgram) clCreateKernelsInProgram;
    decltype(&::clRetainKernel) clRetainKernel;
    decltype(&::clReleaseKernel) clReleaseKernel;
    decltype(&::clSetKernelArg) clSetKernelArg;
    decltype(&::clGetKernelInfo) clGetKernelInfo;
    decltype(&::clGetKernelWorkGroupInfo) clGetKernelWorkGroupInfo;
    decltype(&::clWaitForEvents) clWaitForEvents;
    decltype(&::clGetEventInfo) clGetEventInfo;
    decltype(&::clRetainEvent) clRetainEvent;
    decltype(&::clReleaseEvent) clReleaseEvent;
    decltype(&::clGetEventProfilingInfo) clGetEventProfilingInfo;
    decltype(&::clFlush) clFlush;
    decltype(&::clFinish) clFinish;
    decltype(&::clEnqueueReadBuffer) clEnqueueReadBuffer;
    decltype(&::clEnqueueWriteBuffer) clEnqueueWriteBuffer;
    decltype(&::clEnqueueCopyBuffer) clEnqueueCopyBuffer;
    decltype(&::clEnqueueReadImage) clEnqueueReadImage;
    decltype(&::clEnqueueWriteImage) clEnqueueWriteImage;
    decltype(&::clEnqueueCopyImage) clEnqueueCopyImage;
    decltype(&::clEnqueueCopyImageToBuffer) clEnqueueCopyImageToBuffer;
    decltype(&::clEnqueueCopyBufferToImage) clEnqueueCopyBufferToImage;
    decltype(&::clEnqueueMapBuffer) clEnqueueMapBuffer;
    decltype(&::clEnqueueMapImage) clEnqueueMapImage;
    decltype(&::clEnqueueUnmapMemObject) clEnqueueUnmapMemObject;
    decltype(&::clEnqueueNDRangeKernel) clEnqueueNDRangeKernel;
    decltype(&::clEnqueueTask) clEnqueueTask;
    decltype(&::clEnqueueNativeKernel) clEnqueueNativeKernel;
    decltype(&::clEnqueueMarker) clEnqueueMarker;
    decltype(&::clEnqueueWaitForEvents) clEnqueueWaitForEvents;
    decltype(&::clEnqueueBarrier) clEnqueueBarrier;
    decltype(&::clGetExtensionFunctionAddress) clGetExtensionFunctionAddress;
};

// Fills the table with what `getProc(context, name)` gives. False if an entry point is missing; its
// member is null then, and the others are filled all the same.
bool FillFunctionTable(FunctionTable& table, Core::Proc (*getProc)(void* context, const char* name),
                       void* context);

} // namespace OCL
} // namespace QGF
