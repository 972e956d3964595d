// The entry points of an installable client driver.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <deque>
#include <sstream>
#include <thread>

#include <unistd.h>

#include "Model.h"

namespace scripted {

namespace {

constexpr int kMissingEntryPoint = 125;

// Arguments for the record and for rules.
Argument Number(std::int64_t number)
{
    return {std::to_string(number), number};
}

Argument Enumerant(std::int64_t number)
{
    std::ostringstream text;
    text << "0x" << std::uppercase << std::hex << number;
    return {text.str(), number};
}

Argument Pointer(const void* pointer)
{
    return {pointer != nullptr ? "given" : "null", pointer != nullptr ? 1 : 0};
}

Argument Object(const char* kind, const Handle* handle)
{
    if (handle == nullptr)
        return {"null", -1};
    return {kind + std::to_string(handle->number), handle->number};
}

int DeviceOf(const Handle* handle)
{
    return handle != nullptr ? handle->device : -1;
}

// Returns the status of a call that the rules replace; nothing if they don't.
std::optional<cl_int> StatusOf(const Effect& effect)
{
    if (effect.error)
        return static_cast<cl_int>(*effect.error);
    if (effect.returns)
        return static_cast<cl_int>(*effect.returns);
    return {};
}

std::optional<cl_int> Enter(const char* name, int device, const std::vector<Argument>& arguments)
{
    return StatusOf(GetModel().monitor.Enter(name, device, arguments));
}

// All objects that were made. They are never freed, so that handles stay unique and leak checkers
// don't report objects that the program didn't release.
template <typename Object>
std::deque<Object>& All()
{
    static auto* const all = new std::deque<Object>;
    return *all;
}

// Enters a call that makes an object, and makes it unless the rules replace the call.
template <typename Object>
Object* Make(const char* name, int device, const std::vector<Argument>& arguments, cl_int* status)
{
    const Effect effect = GetModel().monitor.Enter(name, device, arguments);
    if (status != nullptr)
        *status = static_cast<cl_int>(effect.error.value_or(CL_SUCCESS));
    if (effect.error)
        return nullptr;
    if (effect.returns)
        return reinterpret_cast<Object*>(*effect.returns);
    Object& made = All<Object>().emplace_back();
    made.number = static_cast<int>(All<Object>().size());
    made.device = device;
    return &made;
}

cl_int CopyAnswer(const Answers& answers, std::int64_t name, std::size_t size, void* value,
                  std::size_t* actualSize, const Effect& effect)
{
    const auto found = answers.find(name);
    if (found == answers.end())
        return CL_INVALID_VALUE;
    Answer answer = found->second;
    if (effect.text != nullptr) {
        answer.bytes = *effect.text + '\0';
        // With a reported size, a smaller buffer gets the part that fits.
        answer.claim = answer.bytes.size();
    }
    if (effect.claim)
        answer.claim = static_cast<std::uint64_t>(*effect.claim);
    if (value != nullptr) {
        if (size < answer.bytes.size() && !answer.claim)
            return CL_INVALID_VALUE;
        std::memcpy(value, answer.bytes.data(), std::min(size, answer.bytes.size()));
    }
    if (actualSize != nullptr)
        *actualSize = answer.claim ? static_cast<std::size_t>(*answer.claim) : answer.bytes.size();
    return CL_SUCCESS;
}

// Returns a list as OpenCL's two-call queries do.
template <typename Item>
void CopyList(const std::vector<Item>& items, std::optional<std::uint32_t> claim, cl_uint count,
              Item* list, cl_uint* actualCount, const Effect& effect)
{
    if (effect.claim)
        claim = static_cast<std::uint32_t>(*effect.claim);
    if (list != nullptr)
        for (std::size_t i = 0; i < items.size() && i < count; ++i)
            list[i] = items[i];
    if (actualCount != nullptr)
        *actualCount = claim.value_or(static_cast<cl_uint>(items.size()));
}

cl_int CL_API_CALL GetPlatformIDs(cl_uint count, cl_platform_id* platforms, cl_uint* actualCount)
{
    Model& model = GetModel();
    const Effect effect =
        model.monitor.Enter("clIcdGetPlatformIDsKHR", -1, {Number(count)}, Result::Number);
    if (const auto status = StatusOf(effect))
        return *status;
    std::vector<cl_platform_id> all;
    for (const Platform& platform : model.platforms)
        all.push_back(platform.handle);
    if (all.empty() && !model.claimedPlatforms)
        return CL_PLATFORM_NOT_FOUND_KHR;
    CopyList(all, model.claimedPlatforms, count, platforms, actualCount, effect);
    return CL_SUCCESS;
}

cl_int CL_API_CALL GetPlatformInfo(cl_platform_id platform, cl_platform_info name, std::size_t size,
                                   void* value, std::size_t* actualSize)
{
    const Effect effect =
        GetModel().monitor.Enter("clGetPlatformInfo", -1,
                                 {Object("platform", platform), Enumerant(name),
                                  Number(static_cast<std::int64_t>(size)), Pointer(value)},
                                 Result::TextAndSize);
    if (const auto status = StatusOf(effect))
        return *status;
    for (const Platform& each : GetModel().platforms)
        if (each.handle == platform)
            return CopyAnswer(each.answers, name, size, value, actualSize, effect);
    return CL_INVALID_PLATFORM;
}

cl_int CL_API_CALL GetDeviceIDs(cl_platform_id platform, cl_device_type type, cl_uint count,
                                cl_device_id* devices, cl_uint* actualCount)
{
    Model& model = GetModel();
    const Effect effect = model.monitor.Enter(
        "clGetDeviceIDs", -1,
        {Object("platform", platform), Enumerant(static_cast<std::int64_t>(type)), Number(count)},
        Result::Number);
    if (const auto status = StatusOf(effect))
        return *status;
    for (const Platform& each : model.platforms) {
        if (each.handle != platform)
            continue;
        std::vector<cl_device_id> found;
        for (const int number : each.devices) {
            const Device& device = model.devices[static_cast<std::size_t>(number)];
            if ((static_cast<cl_device_type>(device.type) & type) != 0)
                found.push_back(device.handle);
        }
        if (found.empty() && !each.claimedDevices)
            return CL_DEVICE_NOT_FOUND;
        CopyList(found, each.claimedDevices, count, devices, actualCount, effect);
        return CL_SUCCESS;
    }
    return CL_INVALID_PLATFORM;
}

cl_int CL_API_CALL GetDeviceInfo(cl_device_id device, cl_device_info name, std::size_t size,
                                 void* value, std::size_t* actualSize)
{
    const Effect effect =
        GetModel().monitor.Enter("clGetDeviceInfo", DeviceOf(device),
                                 {Object("device", device), Enumerant(name),
                                  Number(static_cast<std::int64_t>(size)), Pointer(value)},
                                 Result::TextAndSize);
    if (const auto status = StatusOf(effect))
        return *status;
    for (const Device& each : GetModel().devices)
        if (device != nullptr && each.handle == device)
            return CopyAnswer(each.answers, name, size, value, actualSize, effect);
    return CL_INVALID_DEVICE;
}

cl_context CL_API_CALL CreateContext(const cl_context_properties* properties, cl_uint count,
                                     const cl_device_id* devices,
                                     void(CL_CALLBACK* callback)(const char*, const void*,
                                                                 std::size_t, void*),
                                     void* user, cl_int* status)
{
    std::vector<Argument> arguments;
    for (; properties != nullptr && properties[0] != 0; properties += 2) {
        arguments.push_back(Enumerant(properties[0]));
        arguments.push_back(Object("platform", reinterpret_cast<cl_platform_id>(properties[1])));
    }
    arguments.push_back(Number(count));
    for (cl_uint i = 0; i < count; ++i)
        arguments.push_back(Object("device", devices[i]));
    arguments.push_back({callback != nullptr ? "given" : "null", {}});
    arguments.push_back(Pointer(user));
    return Make<_cl_context>("clCreateContext", count > 0 ? DeviceOf(devices[0]) : -1, arguments,
                             status);
}

cl_int CL_API_CALL ReleaseContext(cl_context context)
{
    return Enter("clReleaseContext", DeviceOf(context), {Object("context", context)})
        .value_or(CL_SUCCESS);
}

cl_command_queue CL_API_CALL CreateCommandQueue(cl_context context, cl_device_id device,
                                                cl_command_queue_properties properties,
                                                cl_int* status)
{
    return Make<_cl_command_queue>("clCreateCommandQueue", DeviceOf(device),
                                   {Object("context", context), Object("device", device),
                                    Enumerant(static_cast<std::int64_t>(properties))},
                                   status);
}

cl_int CL_API_CALL ReleaseCommandQueue(cl_command_queue queue)
{
    return Enter("clReleaseCommandQueue", DeviceOf(queue), {Object("queue", queue)})
        .value_or(CL_SUCCESS);
}

cl_mem CL_API_CALL CreateBuffer(cl_context context, cl_mem_flags flags, std::size_t size,
                                void* host, cl_int* status)
{
    const cl_mem buffer =
        Make<_cl_mem>("clCreateBuffer", DeviceOf(context),
                      {Object("context", context), Enumerant(static_cast<std::int64_t>(flags)),
                       Number(static_cast<std::int64_t>(size)), Pointer(host)},
                      status);
    if (buffer != nullptr && host != nullptr && (flags & CL_MEM_COPY_HOST_PTR) != 0)
        buffer->content.assign(static_cast<const char*>(host), size);
    return buffer;
}

cl_int CL_API_CALL ReleaseMemObject(cl_mem buffer)
{
    return Enter("clReleaseMemObject", DeviceOf(buffer), {Object("buffer", buffer)})
        .value_or(CL_SUCCESS);
}

cl_program CL_API_CALL CreateProgramWithSource(cl_context context, cl_uint count,
                                               const char** texts, const std::size_t* lengths,
                                               cl_int* status)
{
    std::vector<Argument> arguments{Object("context", context), Number(count)};
    for (cl_uint i = 0; i < count; ++i)
        arguments.push_back({Quoted(texts[i]), {}});
    arguments.push_back(Pointer(lengths));
    return Make<_cl_program>("clCreateProgramWithSource", DeviceOf(context), arguments, status);
}

cl_int CL_API_CALL ReleaseProgram(cl_program program)
{
    return Enter("clReleaseProgram", DeviceOf(program), {Object("program", program)})
        .value_or(CL_SUCCESS);
}

cl_int CL_API_CALL BuildProgram(cl_program program, cl_uint count, const cl_device_id* devices,
                                const char* options, void(CL_CALLBACK* callback)(cl_program, void*),
                                void* user)
{
    return Enter("clBuildProgram", DeviceOf(program),
                 {Object("program", program),
                  Number(count),
                  Pointer(devices),
                  {Quoted(options), {}},
                  {callback != nullptr ? "given" : "null", {}},
                  Pointer(user)})
        .value_or(CL_SUCCESS);
}

cl_kernel CL_API_CALL CreateKernel(cl_program program, const char* name, cl_int* status)
{
    return Make<_cl_kernel>("clCreateKernel", DeviceOf(program),
                            {Object("program", program), {Quoted(name), {}}}, status);
}

cl_int CL_API_CALL ReleaseKernel(cl_kernel kernel)
{
    return Enter("clReleaseKernel", DeviceOf(kernel), {Object("kernel", kernel)})
        .value_or(CL_SUCCESS);
}

cl_int CL_API_CALL SetKernelArg(cl_kernel kernel, cl_uint index, std::size_t size,
                                const void* value)
{
    std::vector<Argument> arguments{Object("kernel", kernel), Number(index),
                                    Number(static_cast<std::int64_t>(size))};
    if (size == sizeof(cl_uint)) {
        cl_uint number = 0;
        std::memcpy(&number, value, size);
        arguments.push_back(Number(number));
    } else if (size == sizeof(cl_mem)) {
        cl_mem buffer = nullptr;
        std::memcpy(&buffer, value, size);
        arguments.push_back(Object("buffer", buffer));
    }
    return Enter("clSetKernelArg", DeviceOf(kernel), arguments).value_or(CL_SUCCESS);
}

using HostClock = std::chrono::steady_clock;

// The time when the commands of all devices with `real-time` have finished.
HostClock::time_point& BusyUntil()
{
    static HostClock::time_point busyUntil = HostClock::now();
    return busyUntil;
}

void WaitForCommands()
{
    std::this_thread::sleep_until(BusyUntil());
}

// Runs a command: advances the device's clock and sets the event's counters.
void Run(cl_event event, int number, bool isCopy)
{
    if (event == nullptr || number < 0)
        return;
    Device& device = GetModel().devices[static_cast<std::size_t>(number)];
    const std::vector<std::int64_t>& durations =
        isCopy ? device.copyNanoseconds : device.kernelNanoseconds;
    std::size_t& count = isCopy ? device.copies : device.kernels;
    const std::int64_t duration = durations[count++ % durations.size()];
    event->start = device.clock;
    device.clock += static_cast<std::uint64_t>(duration);
    event->end = device.clock;
    if (device.realTime)
        BusyUntil() = std::max(BusyUntil(), HostClock::now()) + std::chrono::nanoseconds(duration);
}

// Makes the event of an enqueueing call and runs the command.
cl_int Enqueue(const char* name, const Handle* queue, const std::vector<Argument>& arguments,
               bool isCopy, cl_event* event)
{
    cl_int status = CL_SUCCESS;
    const cl_event made = Make<_cl_event>(name, DeviceOf(queue), arguments, &status);
    if (status != CL_SUCCESS)
        return status;
    Run(made, DeviceOf(queue), isCopy);
    if (event != nullptr)
        *event = made;
    return CL_SUCCESS;
}

cl_int CL_API_CALL EnqueueCopyBuffer(cl_command_queue queue, cl_mem source, cl_mem destination,
                                     std::size_t sourceOffset, std::size_t destinationOffset,
                                     std::size_t size, cl_uint waits, const cl_event* waitList,
                                     cl_event* event)
{
    return Enqueue("clEnqueueCopyBuffer", queue,
                   {Object("queue", queue), Object("buffer", source), Object("buffer", destination),
                    Number(static_cast<std::int64_t>(sourceOffset)),
                    Number(static_cast<std::int64_t>(destinationOffset)),
                    Number(static_cast<std::int64_t>(size)), Number(waits), Pointer(waitList)},
                   true, event);
}

cl_int CL_API_CALL EnqueueNDRangeKernel(cl_command_queue queue, cl_kernel kernel,
                                        cl_uint dimensions, const std::size_t* offset,
                                        const std::size_t* globalSize, const std::size_t* localSize,
                                        cl_uint waits, const cl_event* waitList, cl_event* event)
{
    std::vector<Argument> arguments{Object("queue", queue), Object("kernel", kernel),
                                    Number(dimensions), Pointer(offset)};
    for (const std::size_t* sizes : {globalSize, localSize})
        for (cl_uint i = 0; i < dimensions; ++i)
            arguments.push_back(sizes != nullptr ? Number(static_cast<std::int64_t>(sizes[i]))
                                                 : Pointer(nullptr));
    arguments.push_back(Number(waits));
    arguments.push_back(Pointer(waitList));
    return Enqueue("clEnqueueNDRangeKernel", queue, arguments, false, event);
}

cl_int CL_API_CALL WaitForEvents(cl_uint count, const cl_event* events)
{
    std::vector<Argument> arguments{Number(count)};
    for (cl_uint i = 0; i < count; ++i)
        arguments.push_back(Object("event", events[i]));
    if (const auto status =
            Enter("clWaitForEvents", count > 0 ? DeviceOf(events[0]) : -1, arguments))
        return *status;
    WaitForCommands();
    return CL_SUCCESS;
}

cl_int CL_API_CALL ReleaseEvent(cl_event event)
{
    return Enter("clReleaseEvent", DeviceOf(event), {Object("event", event)}).value_or(CL_SUCCESS);
}

cl_int CL_API_CALL GetEventProfilingInfo(cl_event event, cl_profiling_info name, std::size_t size,
                                         void* value, std::size_t* actualSize)
{
    const Effect effect = GetModel().monitor.Enter(
        "clGetEventProfilingInfo", DeviceOf(event),
        {Object("event", event), Enumerant(name), Number(static_cast<std::int64_t>(size))},
        Result::Number);
    if (const auto status = StatusOf(effect))
        return *status;
    if (event == nullptr)
        return CL_INVALID_EVENT;
    if (size < sizeof(cl_ulong) || value == nullptr)
        return CL_INVALID_VALUE;
    cl_ulong counter = name == CL_PROFILING_COMMAND_END ? event->end : event->start;
    if (effect.claim)
        counter = static_cast<cl_ulong>(*effect.claim);
    std::memcpy(value, &counter, sizeof counter);
    if (actualSize != nullptr)
        *actualSize = sizeof counter;
    return CL_SUCCESS;
}

cl_int CL_API_CALL Finish(cl_command_queue queue)
{
    if (const auto status = Enter("clFinish", DeviceOf(queue), {Object("queue", queue)}))
        return *status;
    WaitForCommands();
    return CL_SUCCESS;
}

cl_int CL_API_CALL Flush(cl_command_queue queue)
{
    return Enter("clFlush", DeviceOf(queue), {Object("queue", queue)}).value_or(CL_SUCCESS);
}

// The entry point of all functions that the driver lacks.
void MissingEntryPoint()
{
    static const char kText[] = "scripted driver: call of a missing OpenCL entry point\n";
    if (::write(STDERR_FILENO, kText, sizeof kText - 1) >= 0)
        ::_exit(kMissingEntryPoint);
    ::_exit(kMissingEntryPoint);
}

cl_icd_dispatch MakeDispatch()
{
    cl_icd_dispatch dispatch{};
    static_assert(sizeof dispatch % sizeof(&MissingEntryPoint) == 0);
    // The table has only function pointers.
    auto* const slots = reinterpret_cast<void (**)()>(&dispatch);
    std::fill_n(slots, sizeof dispatch / sizeof *slots, MissingEntryPoint);

    dispatch.clGetPlatformIDs = GetPlatformIDs;
    dispatch.clGetPlatformInfo = GetPlatformInfo;
    dispatch.clGetDeviceIDs = GetDeviceIDs;
    dispatch.clGetDeviceInfo = GetDeviceInfo;
    dispatch.clCreateContext = CreateContext;
    dispatch.clReleaseContext = ReleaseContext;
    dispatch.clCreateCommandQueue = CreateCommandQueue;
    dispatch.clReleaseCommandQueue = ReleaseCommandQueue;
    dispatch.clCreateBuffer = CreateBuffer;
    dispatch.clReleaseMemObject = ReleaseMemObject;
    dispatch.clCreateProgramWithSource = CreateProgramWithSource;
    dispatch.clReleaseProgram = ReleaseProgram;
    dispatch.clBuildProgram = BuildProgram;
    dispatch.clCreateKernel = CreateKernel;
    dispatch.clReleaseKernel = ReleaseKernel;
    dispatch.clSetKernelArg = SetKernelArg;
    dispatch.clWaitForEvents = WaitForEvents;
    dispatch.clReleaseEvent = ReleaseEvent;
    dispatch.clGetEventProfilingInfo = GetEventProfilingInfo;
    dispatch.clFlush = Flush;
    dispatch.clFinish = Finish;
    dispatch.clEnqueueCopyBuffer = EnqueueCopyBuffer;
    dispatch.clEnqueueNDRangeKernel = EnqueueNDRangeKernel;
    return dispatch;
}

} // namespace

const cl_icd_dispatch* GetDispatch()
{
    static const cl_icd_dispatch dispatch = MakeDispatch();
    return &dispatch;
}

} // namespace scripted

// The functions that a loader looks up by name.
#define SCRIPTED_EXPORT extern "C" __attribute__((visibility("default")))

SCRIPTED_EXPORT cl_int CL_API_CALL clIcdGetPlatformIDsKHR(cl_uint count, cl_platform_id* platforms,
                                                          cl_uint* actualCount)
{
    return scripted::GetPlatformIDs(count, platforms, actualCount);
}

SCRIPTED_EXPORT cl_int CL_API_CALL clGetPlatformInfo(cl_platform_id platform, cl_platform_info name,
                                                     std::size_t size, void* value,
                                                     std::size_t* actualSize)
{
    return scripted::GetPlatformInfo(platform, name, size, value, actualSize);
}

SCRIPTED_EXPORT void* CL_API_CALL clGetExtensionFunctionAddress(const char* name)
{
    if (std::strcmp(name, "clIcdGetPlatformIDsKHR") == 0)
        return reinterpret_cast<void*>(scripted::GetPlatformIDs);
    if (std::strcmp(name, "clGetPlatformInfo") == 0)
        return reinterpret_cast<void*>(scripted::GetPlatformInfo);
    return nullptr;
}
