// A fake OpenCL that records its calls and returns what a test sets. While one lives, it replaces
// the process's OpenCL. Make only one at a time.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <functional>
#include <map>
#include <optional>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "qgf/OCL.h"

namespace assay_test {

// A driver's result for a query.
struct CLAnswer {
    std::string bytes;
    std::optional<std::size_t> claimed; // the reported size; empty: that of `bytes`
    cl_int sizeStatus = CL_SUCCESS;     // of the call that queries only the size
    cl_int valueStatus = CL_SUCCESS;    // of the call that queries the bytes
};

// A text with its terminating zero, as OpenCL returns it.
inline CLAnswer CLText(const std::string& text)
{
    return {text + '\0', {}, CL_SUCCESS, CL_SUCCESS};
}

template <typename T>
CLAnswer CLValue(T value)
{
    return {std::string(reinterpret_cast<const char*>(&value), sizeof value),
            {},
            CL_SUCCESS,
            CL_SUCCESS};
}

struct CLFakeDevice {
    std::uintptr_t id; // 0 for a null id
    cl_device_type type = CL_DEVICE_TYPE_GPU;
    std::map<cl_device_info, CLAnswer> answers;
};

struct CLFakePlatform {
    std::uintptr_t id;
    std::map<cl_platform_info, CLAnswer> answers;
    std::vector<CLFakeDevice> devices;
    cl_int devicesStatus = CL_SUCCESS;
    std::optional<cl_uint> claimedDevices; // the reported count; empty: that of `devices`
};

class FakeOpenCL {
public:
    FakeOpenCL()
    {
        Current() = this;
        fTable.clGetPlatformIDs = GetPlatformIDs;
        fTable.clGetPlatformInfo = GetPlatformInfo;
        fTable.clGetDeviceIDs = GetDeviceIDs;
        fTable.clGetDeviceInfo = GetDeviceInfo;
        fTable.clCreateContext = CreateContext;
        fTable.clReleaseContext = ReleaseContext;
        fTable.clCreateCommandQueue = CreateCommandQueue;
        fTable.clReleaseCommandQueue = ReleaseCommandQueue;
        fTable.clCreateBuffer = CreateBuffer;
        fTable.clReleaseMemObject = ReleaseMemObject;
        fTable.clCreateProgramWithSource = CreateProgramWithSource;
        fTable.clBuildProgram = BuildProgram;
        fTable.clCreateKernel = CreateKernel;
        fTable.clSetKernelArg = SetKernelArg;
        fTable.clWaitForEvents = WaitForEvents;
        fTable.clReleaseEvent = ReleaseEvent;
        fTable.clGetEventProfilingInfo = GetEventProfilingInfo;
        fTable.clFinish = Finish;
        fTable.clEnqueueCopyBuffer = EnqueueCopyBuffer;
        fTable.clEnqueueNDRangeKernel = EnqueueNDRangeKernel;
        QGF::OCL::ExtensionManager::ReplaceTable(&fTable);
    }
    ~FakeOpenCL()
    {
        QGF::OCL::ExtensionManager::ReplaceTable(nullptr);
        Current() = nullptr;
    }
    FakeOpenCL(const FakeOpenCL&) = delete;
    FakeOpenCL& operator=(const FakeOpenCL&) = delete;

    std::vector<CLFakePlatform> platforms;
    cl_int platformsStatus = CL_SUCCESS;
    std::optional<cl_uint> claimedPlatforms;

    // Returns start and end of an event by its number, counted from 1 in the order of creation.
    std::function<std::pair<cl_ulong, cl_ulong>(int event)> counters = [](int) {
        return std::pair<cl_ulong, cl_ulong>{0, 0};
    };

    // The statuses of failing calls, by their index in `calls`. A failing call does nothing else.
    std::map<std::size_t, cl_int> failing;

    // The names of calls that throw a std::runtime_error.
    std::set<std::string> throwing;

    // The calls with their arguments, in order.
    std::vector<std::string> calls;

    // The number of objects by kind ("context", "queue", "buffer", "program", "kernel", "event").
    std::map<std::string, int> created;
    std::map<std::string, int> released;

    // The source text of the program and the content of the last buffer that was made with one.
    std::string source;
    std::vector<float> content;
    // The bytes of the kernel arguments, by index.
    std::map<cl_uint, std::string> kernelArguments;

    static cl_device_id DeviceID(std::uintptr_t id) { return ToHandle<cl_device_id>(id); }
    static cl_platform_id PlatformID(std::uintptr_t id) { return ToHandle<cl_platform_id>(id); }

private:
    static FakeOpenCL*& Current()
    {
        static FakeOpenCL* current = nullptr;
        return current;
    }

    // Handles are small numbers, which are recorded in the calls; they are never dereferenced.
    template <typename Handle>
    static Handle ToHandle(std::uintptr_t number)
    {
        return reinterpret_cast<Handle>(number); // NOLINT(performance-no-int-to-ptr)
    }
    template <typename Handle>
    static std::uintptr_t Number(Handle handle)
    {
        return reinterpret_cast<std::uintptr_t>(handle);
    }

    template <typename... Arguments>
    cl_int Enter(const char* name, const Arguments&... arguments)
    {
        std::ostringstream line;
        const char* separator = "";
        line << name << '(';
        ((line << separator << arguments, separator = ", "), ...);
        line << ')';
        calls.push_back(line.str());
        if (throwing.count(name) != 0)
            throw std::runtime_error(std::string(name) + " throws");
        const auto found = failing.find(calls.size() - 1);
        return found != failing.end() ? found->second : CL_SUCCESS;
    }

    template <typename Handle>
    Handle Make(const char* kind, cl_int status, cl_int* statusOut)
    {
        if (statusOut != nullptr)
            *statusOut = status;
        return status == CL_SUCCESS ? Make<Handle>(kind) : nullptr;
    }

    template <typename Handle>
    Handle Make(const char* kind)
    {
        return ToHandle<Handle>(static_cast<std::uintptr_t>(++created[kind]));
    }

    cl_int Release(const char* kind, cl_int status)
    {
        if (status == CL_SUCCESS)
            ++released[kind];
        return status;
    }

    static std::string Show(const char* what, std::uintptr_t number)
    {
        return std::string(what) + " " + std::to_string(number);
    }
    static std::string ShowPointer(const void* pointer) { return pointer ? "given" : "null"; }

    static cl_int Answer(const std::map<cl_uint, CLAnswer>& answers, cl_uint property,
                         std::size_t size, void* value, std::size_t* actualSize)
    {
        const auto found = answers.find(property);
        if (found == answers.end())
            return CL_INVALID_VALUE;
        const CLAnswer& answer = found->second;
        const cl_int status = value != nullptr ? answer.valueStatus : answer.sizeStatus;
        // A driver may write the value before it fails.
        if (value != nullptr)
            std::memcpy(value, answer.bytes.data(), std::min(size, answer.bytes.size()));
        if (status != CL_SUCCESS)
            return status;
        if (actualSize != nullptr)
            *actualSize = answer.claimed.value_or(answer.bytes.size());
        return CL_SUCCESS;
    }

    static cl_int CL_API_CALL GetPlatformIDs(cl_uint count, cl_platform_id* ids, cl_uint* actual)
    {
        FakeOpenCL& cl = *Current();
        if (const cl_int status = cl.Enter("clGetPlatformIDs", count))
            return status;
        if (cl.platformsStatus != CL_SUCCESS)
            return cl.platformsStatus;
        if (actual != nullptr)
            *actual = ids == nullptr && cl.claimedPlatforms
                          ? *cl.claimedPlatforms
                          : static_cast<cl_uint>(cl.platforms.size());
        if (ids != nullptr)
            for (cl_uint i = 0; i < count && i < cl.platforms.size(); ++i)
                ids[i] = PlatformID(cl.platforms[i].id);
        return CL_SUCCESS;
    }

    static cl_int CL_API_CALL GetPlatformInfo(cl_platform_id id, cl_platform_info property,
                                              std::size_t size, void* value, std::size_t* actual)
    {
        FakeOpenCL& cl = *Current();
        if (const cl_int status =
                cl.Enter("clGetPlatformInfo", Show("platform", Number(id)), property, size))
            return status;
        for (const CLFakePlatform& platform : cl.platforms)
            if (platform.id == Number(id))
                return Answer(platform.answers, property, size, value, actual);
        return CL_INVALID_PLATFORM;
    }

    static cl_int CL_API_CALL GetDeviceIDs(cl_platform_id id, cl_device_type type, cl_uint count,
                                           cl_device_id* ids, cl_uint* actual)
    {
        FakeOpenCL& cl = *Current();
        if (const cl_int status =
                cl.Enter("clGetDeviceIDs", Show("platform", Number(id)), type, count))
            return status;
        for (const CLFakePlatform& platform : cl.platforms) {
            if (platform.id != Number(id))
                continue;
            if (platform.devicesStatus != CL_SUCCESS)
                return platform.devicesStatus;
            std::vector<cl_device_id> found;
            for (const CLFakeDevice& device : platform.devices)
                if ((device.type & type) != 0)
                    found.push_back(DeviceID(device.id));
            if (found.empty() && !platform.claimedDevices)
                return CL_DEVICE_NOT_FOUND;
            if (actual != nullptr)
                *actual = ids == nullptr && platform.claimedDevices
                              ? *platform.claimedDevices
                              : static_cast<cl_uint>(found.size());
            if (ids != nullptr)
                for (cl_uint i = 0; i < count && i < found.size(); ++i)
                    ids[i] = found[i];
            return CL_SUCCESS;
        }
        return CL_INVALID_PLATFORM;
    }

    static cl_int CL_API_CALL GetDeviceInfo(cl_device_id id, cl_device_info property,
                                            std::size_t size, void* value, std::size_t* actual)
    {
        FakeOpenCL& cl = *Current();
        if (const cl_int status =
                cl.Enter("clGetDeviceInfo", Show("device", Number(id)), property, size))
            return status;
        for (const CLFakePlatform& platform : cl.platforms)
            for (const CLFakeDevice& device : platform.devices)
                if (id != nullptr && device.id == Number(id))
                    return Answer(device.answers, property, size, value, actual);
        return CL_INVALID_DEVICE;
    }

    static cl_context CL_API_CALL CreateContext(
        const cl_context_properties* properties, cl_uint count, const cl_device_id* devices,
        void(CL_CALLBACK* callback)(const char*, const void*, std::size_t, void*), void* user,
        cl_int* status)
    {
        FakeOpenCL& cl = *Current();
        std::string list;
        for (; *properties != 0; properties += 2)
            list += std::to_string(properties[0]) + "=" + std::to_string(properties[1]);
        std::string deviceList;
        for (cl_uint i = 0; i < count; ++i)
            deviceList += Show("device", Number(devices[i]));
        const cl_int result = cl.Enter("clCreateContext", list, deviceList,
                                       callback != nullptr ? "given" : "null", ShowPointer(user));
        return cl.Make<cl_context>("context", result, status);
    }

    static cl_int CL_API_CALL ReleaseContext(cl_context context)
    {
        FakeOpenCL& cl = *Current();
        return cl.Release("context",
                          cl.Enter("clReleaseContext", Show("context", Number(context))));
    }

    static cl_command_queue CL_API_CALL CreateCommandQueue(cl_context context, cl_device_id device,
                                                           cl_command_queue_properties properties,
                                                           cl_int* status)
    {
        FakeOpenCL& cl = *Current();
        const cl_int result = cl.Enter("clCreateCommandQueue", Show("context", Number(context)),
                                       Show("device", Number(device)), properties);
        return cl.Make<cl_command_queue>("queue", result, status);
    }

    static cl_int CL_API_CALL ReleaseCommandQueue(cl_command_queue queue)
    {
        FakeOpenCL& cl = *Current();
        return cl.Release("queue", cl.Enter("clReleaseCommandQueue", Show("queue", Number(queue))));
    }

    static cl_mem CL_API_CALL CreateBuffer(cl_context context, cl_mem_flags flags, std::size_t size,
                                           void* host, cl_int* status)
    {
        FakeOpenCL& cl = *Current();
        const cl_int result = cl.Enter("clCreateBuffer", Show("context", Number(context)), flags,
                                       size, ShowPointer(host));
        if (host != nullptr) {
            cl.content.resize(size / sizeof(float));
            std::memcpy(cl.content.data(), host, cl.content.size() * sizeof(float));
        }
        return cl.Make<cl_mem>("buffer", result, status);
    }

    static cl_int CL_API_CALL ReleaseMemObject(cl_mem buffer)
    {
        FakeOpenCL& cl = *Current();
        return cl.Release("buffer", cl.Enter("clReleaseMemObject", Show("buffer", Number(buffer))));
    }

    static cl_program CL_API_CALL CreateProgramWithSource(cl_context context, cl_uint count,
                                                          const char** texts,
                                                          const std::size_t* lengths,
                                                          cl_int* status)
    {
        FakeOpenCL& cl = *Current();
        const cl_int result =
            cl.Enter("clCreateProgramWithSource", Show("context", Number(context)), count,
                     ShowPointer(lengths));
        cl.source = texts[0];
        return cl.Make<cl_program>("program", result, status);
    }

    static cl_int CL_API_CALL BuildProgram(cl_program program, cl_uint count,
                                           const cl_device_id* devices, const char* options,
                                           void(CL_CALLBACK* callback)(cl_program, void*),
                                           void* user)
    {
        return Current()->Enter("clBuildProgram", Show("program", Number(program)), count,
                                ShowPointer(devices), ShowPointer(options),
                                callback != nullptr ? "given" : "null", ShowPointer(user));
    }

    static cl_kernel CL_API_CALL CreateKernel(cl_program program, const char* name, cl_int* status)
    {
        FakeOpenCL& cl = *Current();
        const cl_int result = cl.Enter("clCreateKernel", Show("program", Number(program)), name);
        return cl.Make<cl_kernel>("kernel", result, status);
    }

    static cl_int CL_API_CALL SetKernelArg(cl_kernel kernel, cl_uint index, std::size_t size,
                                           const void* value)
    {
        FakeOpenCL& cl = *Current();
        cl.kernelArguments[index] = std::string(static_cast<const char*>(value), size);
        return cl.Enter("clSetKernelArg", Show("kernel", Number(kernel)), index, size);
    }

    static cl_int CL_API_CALL WaitForEvents(cl_uint count, const cl_event* events)
    {
        return Current()->Enter("clWaitForEvents", count, Show("event", Number(events[0])));
    }

    static cl_int CL_API_CALL ReleaseEvent(cl_event event)
    {
        FakeOpenCL& cl = *Current();
        return cl.Release("event", cl.Enter("clReleaseEvent", Show("event", Number(event))));
    }

    static cl_int CL_API_CALL GetEventProfilingInfo(cl_event event, cl_profiling_info which,
                                                    std::size_t size, void* value,
                                                    std::size_t* actual)
    {
        FakeOpenCL& cl = *Current();
        if (const cl_int status = cl.Enter("clGetEventProfilingInfo", Show("event", Number(event)),
                                           which, size, ShowPointer(actual)))
            return status;
        const auto [start, end] = cl.counters(static_cast<int>(Number(event)));
        const cl_ulong answer = which == CL_PROFILING_COMMAND_END ? end : start;
        std::memcpy(value, &answer, sizeof answer);
        return CL_SUCCESS;
    }

    static cl_int CL_API_CALL Finish(cl_command_queue queue)
    {
        return Current()->Enter("clFinish", Show("queue", Number(queue)));
    }

    static cl_int CL_API_CALL EnqueueCopyBuffer(cl_command_queue queue, cl_mem source,
                                                cl_mem destination, std::size_t sourceOffset,
                                                std::size_t destinationOffset, std::size_t size,
                                                cl_uint waits, const cl_event* waitList,
                                                cl_event* event)
    {
        FakeOpenCL& cl = *Current();
        const cl_int status =
            cl.Enter("clEnqueueCopyBuffer", Show("queue", Number(queue)),
                     Show("buffer", Number(source)), Show("buffer", Number(destination)),
                     sourceOffset, destinationOffset, size, waits, ShowPointer(waitList));
        if (status == CL_SUCCESS)
            *event = cl.Make<cl_event>("event");
        return status;
    }

    static cl_int CL_API_CALL EnqueueNDRangeKernel(cl_command_queue queue, cl_kernel kernel,
                                                   cl_uint dimensions, const std::size_t* offset,
                                                   const std::size_t* globalSize,
                                                   const std::size_t* localSize, cl_uint waits,
                                                   const cl_event* waitList, cl_event* event)
    {
        FakeOpenCL& cl = *Current();
        const cl_int status =
            cl.Enter("clEnqueueNDRangeKernel", Show("queue", Number(queue)),
                     Show("kernel", Number(kernel)), dimensions, ShowPointer(offset), globalSize[0],
                     localSize[0], waits, ShowPointer(waitList));
        if (status == CL_SUCCESS)
            *event = cl.Make<cl_event>("event");
        return status;
    }

    // Unused entries are null, so that an unexpected call crashes.
    QGF::OCL::FunctionTable fTable{};
};

} // namespace assay_test
