#include "Model.h"

#include <cstdlib>

namespace scripted {

namespace {

#define SCRIPTED_NAME(name)                                                                        \
    {                                                                                              \
#name, name                                                                                \
    }

const std::map<std::string, std::int64_t> kNames = {
    SCRIPTED_NAME(CL_SUCCESS),
    SCRIPTED_NAME(CL_DEVICE_NOT_FOUND),
    SCRIPTED_NAME(CL_DEVICE_NOT_AVAILABLE),
    SCRIPTED_NAME(CL_COMPILER_NOT_AVAILABLE),
    SCRIPTED_NAME(CL_MEM_OBJECT_ALLOCATION_FAILURE),
    SCRIPTED_NAME(CL_OUT_OF_RESOURCES),
    SCRIPTED_NAME(CL_OUT_OF_HOST_MEMORY),
    SCRIPTED_NAME(CL_PROFILING_INFO_NOT_AVAILABLE),
    SCRIPTED_NAME(CL_MEM_COPY_OVERLAP),
    SCRIPTED_NAME(CL_BUILD_PROGRAM_FAILURE),
    SCRIPTED_NAME(CL_EXEC_STATUS_ERROR_FOR_EVENTS_IN_WAIT_LIST),
    SCRIPTED_NAME(CL_INVALID_VALUE),
    SCRIPTED_NAME(CL_INVALID_DEVICE_TYPE),
    SCRIPTED_NAME(CL_INVALID_PLATFORM),
    SCRIPTED_NAME(CL_INVALID_DEVICE),
    SCRIPTED_NAME(CL_INVALID_CONTEXT),
    SCRIPTED_NAME(CL_INVALID_QUEUE_PROPERTIES),
    SCRIPTED_NAME(CL_INVALID_COMMAND_QUEUE),
    SCRIPTED_NAME(CL_INVALID_HOST_PTR),
    SCRIPTED_NAME(CL_INVALID_MEM_OBJECT),
    SCRIPTED_NAME(CL_INVALID_IMAGE_FORMAT_DESCRIPTOR),
    SCRIPTED_NAME(CL_INVALID_IMAGE_SIZE),
    SCRIPTED_NAME(CL_INVALID_SAMPLER),
    SCRIPTED_NAME(CL_INVALID_BINARY),
    SCRIPTED_NAME(CL_INVALID_BUILD_OPTIONS),
    SCRIPTED_NAME(CL_INVALID_PROGRAM),
    SCRIPTED_NAME(CL_INVALID_PROGRAM_EXECUTABLE),
    SCRIPTED_NAME(CL_INVALID_KERNEL_NAME),
    SCRIPTED_NAME(CL_INVALID_KERNEL_DEFINITION),
    SCRIPTED_NAME(CL_INVALID_KERNEL),
    SCRIPTED_NAME(CL_INVALID_ARG_INDEX),
    SCRIPTED_NAME(CL_INVALID_ARG_VALUE),
    SCRIPTED_NAME(CL_INVALID_ARG_SIZE),
    SCRIPTED_NAME(CL_INVALID_KERNEL_ARGS),
    SCRIPTED_NAME(CL_INVALID_WORK_DIMENSION),
    SCRIPTED_NAME(CL_INVALID_WORK_GROUP_SIZE),
    SCRIPTED_NAME(CL_INVALID_WORK_ITEM_SIZE),
    SCRIPTED_NAME(CL_INVALID_GLOBAL_OFFSET),
    SCRIPTED_NAME(CL_INVALID_EVENT_WAIT_LIST),
    SCRIPTED_NAME(CL_INVALID_EVENT),
    SCRIPTED_NAME(CL_INVALID_OPERATION),
    SCRIPTED_NAME(CL_INVALID_GL_OBJECT),
    SCRIPTED_NAME(CL_INVALID_BUFFER_SIZE),
    SCRIPTED_NAME(CL_INVALID_MIP_LEVEL),
    SCRIPTED_NAME(CL_INVALID_GLOBAL_WORK_SIZE),
    SCRIPTED_NAME(CL_INVALID_PROPERTY),
    SCRIPTED_NAME(CL_INVALID_IMAGE_DESCRIPTOR),
    SCRIPTED_NAME(CL_INVALID_COMPILER_OPTIONS),
    SCRIPTED_NAME(CL_INVALID_LINKER_OPTIONS),
    SCRIPTED_NAME(CL_INVALID_DEVICE_PARTITION_COUNT),
    SCRIPTED_NAME(CL_PLATFORM_PROFILE),
    SCRIPTED_NAME(CL_PLATFORM_VERSION),
    SCRIPTED_NAME(CL_PLATFORM_NAME),
    SCRIPTED_NAME(CL_PLATFORM_VENDOR),
    SCRIPTED_NAME(CL_PLATFORM_EXTENSIONS),
    SCRIPTED_NAME(CL_DEVICE_TYPE_DEFAULT),
    SCRIPTED_NAME(CL_DEVICE_TYPE_CPU),
    SCRIPTED_NAME(CL_DEVICE_TYPE_GPU),
    SCRIPTED_NAME(CL_DEVICE_TYPE_ACCELERATOR),
    SCRIPTED_NAME(CL_DEVICE_TYPE_CUSTOM),
    SCRIPTED_NAME(CL_DEVICE_TYPE_ALL),
    SCRIPTED_NAME(CL_DEVICE_TYPE),
    SCRIPTED_NAME(CL_DEVICE_VENDOR_ID),
    SCRIPTED_NAME(CL_DEVICE_MAX_COMPUTE_UNITS),
    SCRIPTED_NAME(CL_DEVICE_MAX_WORK_GROUP_SIZE),
    SCRIPTED_NAME(CL_DEVICE_MAX_CLOCK_FREQUENCY),
    SCRIPTED_NAME(CL_DEVICE_MAX_MEM_ALLOC_SIZE),
    SCRIPTED_NAME(CL_DEVICE_GLOBAL_MEM_SIZE),
    SCRIPTED_NAME(CL_DEVICE_LOCAL_MEM_SIZE),
    SCRIPTED_NAME(CL_DEVICE_AVAILABLE),
    SCRIPTED_NAME(CL_DEVICE_COMPILER_AVAILABLE),
    SCRIPTED_NAME(CL_DEVICE_NAME),
    SCRIPTED_NAME(CL_DEVICE_VENDOR),
    SCRIPTED_NAME(CL_DRIVER_VERSION),
    SCRIPTED_NAME(CL_DEVICE_PROFILE),
    SCRIPTED_NAME(CL_DEVICE_VERSION),
    SCRIPTED_NAME(CL_DEVICE_EXTENSIONS),
    SCRIPTED_NAME(CL_DEVICE_HOST_UNIFIED_MEMORY),
    SCRIPTED_NAME(CL_DEVICE_PLATFORM),
    SCRIPTED_NAME(CL_DEVICE_OPENCL_C_VERSION),
    SCRIPTED_NAME(CL_MEM_READ_WRITE),
    SCRIPTED_NAME(CL_MEM_WRITE_ONLY),
    SCRIPTED_NAME(CL_MEM_READ_ONLY),
    SCRIPTED_NAME(CL_MEM_USE_HOST_PTR),
    SCRIPTED_NAME(CL_MEM_COPY_HOST_PTR),
    SCRIPTED_NAME(CL_PROFILING_COMMAND_QUEUED),
    SCRIPTED_NAME(CL_PROFILING_COMMAND_SUBMIT),
    SCRIPTED_NAME(CL_PROFILING_COMMAND_START),
    SCRIPTED_NAME(CL_PROFILING_COMMAND_END),
    SCRIPTED_NAME(CL_PLATFORM_ICD_SUFFIX_KHR),
    SCRIPTED_NAME(CL_PLATFORM_NOT_FOUND_KHR),
};

#undef SCRIPTED_NAME

// A text with its terminating zero.
Answer Terminated(const std::string& text)
{
    return {text + '\0', {}};
}

template <typename Number>
Answer Bytes(Number number)
{
    return {std::string(reinterpret_cast<const char*>(&number), sizeof(Number)), {}};
}

void AddPlatform(Model& model)
{
    Platform& platform = model.platforms.emplace_back();
    platform.handle = new _cl_platform_id;
    platform.handle->number = static_cast<int>(model.platforms.size()) - 1;
    platform.answers = {{CL_PLATFORM_PROFILE, Terminated("FULL_PROFILE")},
                        {CL_PLATFORM_VERSION, Terminated("OpenCL 1.2 scripted")},
                        {CL_PLATFORM_NAME, Terminated("Scripted platform")},
                        {CL_PLATFORM_VENDOR, Terminated("Scripted vendor")},
                        {CL_PLATFORM_EXTENSIONS, Terminated("cl_khr_icd")},
                        {CL_PLATFORM_ICD_SUFFIX_KHR, Terminated("SCRIPTED")}};
}

void AddDevice(Model& model, bool hasHandle)
{
    if (model.platforms.empty())
        AddPlatform(model);
    const int number = static_cast<int>(model.devices.size());
    Device& device = model.devices.emplace_back();
    if (hasHandle) {
        device.handle = new _cl_device_id;
        device.handle->number = number;
        device.handle->device = number;
    }
    Platform& platform = model.platforms.back();
    platform.devices.push_back(number);
    device.answers = {{CL_DEVICE_PLATFORM, Bytes(platform.handle)},
                      {CL_DEVICE_NAME, Terminated("Scripted device " + std::to_string(number))},
                      {CL_DEVICE_VENDOR, Terminated("Scripted vendor")},
                      {CL_DEVICE_VENDOR_ID, Bytes(cl_uint{0x5C1})},
                      {CL_DEVICE_GLOBAL_MEM_SIZE, Bytes(cl_ulong{1} << 30U)},
                      {CL_DRIVER_VERSION, Terminated("1.0")},
                      {CL_DEVICE_VERSION, Terminated("OpenCL 1.2 scripted")},
                      {CL_DEVICE_HOST_UNIFIED_MEMORY, Bytes(cl_bool{CL_FALSE})}};
}

std::int64_t TakeType(Line& line)
{
    if (line.TakeIf("cpu"))
        return CL_DEVICE_TYPE_CPU;
    if (line.TakeIf("accelerator"))
        return CL_DEVICE_TYPE_ACCELERATOR;
    line.TakeIf("gpu");
    return CL_DEVICE_TYPE_GPU;
}

std::vector<std::int64_t> TakeNumbers(Line& line, const char* what)
{
    std::vector<std::int64_t> numbers{line.TakeNumber(what)};
    while (!line.AtEnd())
        numbers.push_back(line.TakeNumber(what));
    return numbers;
}

// Reads a property of the last device or platform. Returns false for other directives.
bool ReadAnswer(const std::string& directive, Line& line, Answers& answers)
{
    const bool isText = directive == "text" || directive == "bytes";
    if (!isText && directive != "uint" && directive != "ulong" && directive != "claim" &&
        directive != "absent")
        return false;
    const std::int64_t name = line.TakeNumber("the name of a property", NumberOf);
    if (isText) {
        const std::string text = line.TakeText("the text").value_or("");
        answers[name] = directive == "text" ? Terminated(text) : Answer{text, {}};
    } else if (directive == "uint") {
        answers[name] = Bytes(static_cast<cl_uint>(line.TakeNumber("a number", NumberOf)));
    } else if (directive == "ulong") {
        answers[name] = Bytes(static_cast<cl_ulong>(line.TakeNumber("a number", NumberOf)));
    } else if (directive == "claim") {
        answers[name].claim = static_cast<std::uint64_t>(line.TakeNumber("a size"));
    } else {
        answers.erase(name);
    }
    return true;
}

bool ReadDeviceLine(const std::string& directive, Line& line, Device& device)
{
    if (directive == "copy-ns")
        device.copyNanoseconds = TakeNumbers(line, "nanoseconds");
    else if (directive == "kernel-ns")
        device.kernelNanoseconds = TakeNumbers(line, "nanoseconds");
    else if (directive == "clock")
        device.clock = static_cast<std::uint64_t>(line.TakeNumber("nanoseconds"));
    else if (directive == "real-time")
        device.realTime = true;
    else
        return ReadAnswer(directive, line, device.answers);
    return true;
}

void ReadModel(Model& model, const std::string& path)
{
    Answers* answers = nullptr;
    Device* device = nullptr;
    for (Line& line : ReadScript(path)) {
        const std::string directive = line.Take("a directive").text;
        if (directive == "record") {
            model.monitor.RecordTo(line.Take("a file").text);
        } else if (directive == "at") {
            model.monitor.AddRule(line, NumberOf);
        } else if (directive == "claim-platforms") {
            model.claimedPlatforms = static_cast<std::uint32_t>(line.TakeNumber("a count"));
        } else if (directive == "platform") {
            AddPlatform(model);
            answers = &model.platforms.back().answers;
            device = nullptr;
        } else if (directive == "claim-devices") {
            if (model.platforms.empty())
                line.Fail("there is no platform yet");
            model.platforms.back().claimedDevices =
                static_cast<std::uint32_t>(line.TakeNumber("a count"));
        } else if (directive == "device") {
            AddDevice(model, !line.TakeIf("null"));
            device = &model.devices.back();
            device->type = TakeType(line);
        } else if (device == nullptr && answers == nullptr) {
            line.Fail("\"" + directive + "\" before the first platform or device");
        } else if (device != nullptr ? !ReadDeviceLine(directive, line, *device)
                                     : !ReadAnswer(directive, line, *answers)) {
            line.Fail("unknown directive \"" + directive + "\"");
        }
        if (!line.AtEnd())
            line.Fail("unexpected words at the end");
    }
}

Model* MakeModel()
{
    auto* const model = new Model; // never freed: the driver may be called from exit handlers
    // NOLINTNEXTLINE(concurrency-mt-unsafe): the program under test doesn't change its environment
    if (const char* const path = std::getenv("ASSAY_SCRIPTED_OPENCL"); path != nullptr && *path)
        ReadModel(*model, path);
    else
        AddDevice(*model, true);
    return model;
}

} // namespace

Model& GetModel()
{
    static Model* const model = MakeModel();
    return *model;
}

std::optional<std::int64_t> NumberOf(const std::string& name)
{
    const auto found = kNames.find(name);
    if (found == kNames.end())
        return {};
    return found->second;
}

} // namespace scripted
