#include "qgf/OCLFunctionTable.h"

namespace QGF {
namespace OCL {

namespace {

// Each returns whether the entry point is there or isn't needed.
template <typename Function>
bool Fill(Function& member, Core::Proc proc)
{
    member = reinterpret_cast<Function>(proc);
    return proc != nullptr;
}

template <typename Function>
bool Fill(Uncalled<Function>& member, Core::Proc proc)
{
    member.address = reinterpret_cast<Function>(proc);
    return true;
}

} // namespace

bool FillFunctionTable(FunctionTable& table, Core::Proc (*getProc)(void* context, const char* name),
                       void* context)
{
    bool complete = true;

// A member and the entry point behind it have one name, which only the preprocessor can write
// twice.
#define QGF_OCL_FILL(name) complete = Fill(table.name, getProc(context, #name)) && complete

    QGF_OCL_FILL(clGetPlatformIDs);
    QGF_OCL_FILL(clGetPlatformInfo);
    QGF_OCL_FILL(clGetDeviceIDs);
    QGF_OCL_FILL(clGetDeviceInfo);
    QGF_OCL_FILL(clCreateContext);
    QGF_OCL_FILL(clCreateContextFromType);
    QGF_OCL_FILL(clRetainContext);
    QGF_OCL_FILL(clReleaseContext);
    QGF_OCL_FILL(clGetContextInfo);
    QGF_OCL_FILL(clCreateCommandQueue);
    QGF_OCL_FILL(clRetainCommandQueue);
    QGF_OCL_FILL(clReleaseCommandQueue);
    QGF_OCL_FILL(clGetCommandQueueInfo);
    QGF_OCL_FILL(clSetCommandQueueProperty);
    QGF_OCL_FILL(clCreateBuffer);
    QGF_OCL_FILL(clCreateImage2D);
    QGF_OCL_FILL(clCreateImage3D);
    QGF_OCL_FILL(clRetainMemObject);
    QGF_OCL_FILL(clReleaseMemObject);
    QGF_OCL_FILL(clGetSupportedImageFormats);
    QGF_OCL_FILL(clGetMemObjectInfo);
    QGF_OCL_FILL(clGetImageInfo);
    QGF_OCL_FILL(clCreateSampler);
    QGF_OCL_FILL(clRetainSampler);
    QGF_OCL_FILL(clReleaseSampler);
    QGF_OCL_FILL(clGetSamplerInfo);
    QGF_OCL_FILL(clCreateProgramWithSource);
    QGF_OCL_FILL(clCreateProgramWithBinary);
    QGF_OCL_FILL(clRetainProgram);
    QGF_OCL_FILL(clReleaseProgram);
    QGF_OCL_FILL(clBuildProgram);
    QGF_OCL_FILL(clUnloadCompiler);
    QGF_OCL_FILL(clGetProgramInfo);
    QGF_OCL_FILL(clGetProgramBuildInfo);
    QGF_OCL_FILL(clCreateKernel);
    QGF_OCL_FILL(clCreateKernelsInProgram);
    QGF_OCL_FILL(clRetainKernel);
    QGF_OCL_FILL(clReleaseKernel);
    QGF_OCL_FILL(clSetKernelArg);
    QGF_OCL_FILL(clGetKernelInfo);
    QGF_OCL_FILL(clGetKernelWorkGroupInfo);
    QGF_OCL_FILL(clWaitForEvents);
    QGF_OCL_FILL(clGetEventInfo);
    QGF_OCL_FILL(clRetainEvent);
    QGF_OCL_FILL(clReleaseEvent);
    QGF_OCL_FILL(clGetEventProfilingInfo);
    QGF_OCL_FILL(clFlush);
    QGF_OCL_FILL(clFinish);
    QGF_OCL_FILL(clEnqueueReadBuffer);
    QGF_OCL_FILL(clEnqueueWriteBuffer);
    QGF_OCL_FILL(clEnqueueCopyBuffer);
    QGF_OCL_FILL(clEnqueueReadImage);
    QGF_OCL_FILL(clEnqueueWriteImage);
    QGF_OCL_FILL(clEnqueueCopyImage);
    QGF_OCL_FILL(clEnqueueCopyImageToBuffer);
    QGF_OCL_FILL(clEnqueueCopyBufferToImage);
    QGF_OCL_FILL(clEnqueueMapBuffer);
    QGF_OCL_FILL(clEnqueueMapImage);
    QGF_OCL_FILL(clEnqueueUnmapMemObject);
    QGF_OCL_FILL(clEnqueueNDRangeKernel);
    QGF_OCL_FILL(clEnqueueTask);
    QGF_OCL_FILL(clEnqueueNativeKernel);
    QGF_OCL_FILL(clEnqueueMarker);
    QGF_OCL_FILL(clEnqueueWaitForEvents);
    QGF_OCL_FILL(clEnqueueBarrier);
    QGF_OCL_FILL(clGetExtensionFunctionAddress);

#undef QGF_OCL_FILL
    return complete;
}

} // namespace OCL
} // namespace QGF
