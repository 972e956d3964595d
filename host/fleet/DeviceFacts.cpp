#include "fleet/DeviceFacts.h"

#include <algorithm>
#include <cmath>
#include <optional>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/Numbers.h"
#include "report/Software.h"
#include "report/ValueText.h"

namespace assay_host {

namespace {

using Value = std::variant<std::string, double, bool>;

constexpr char kName[] = "name";
constexpr char kSoftware[] = "software";
constexpr char kFailed[] = "failed";

const Answer* Find(const DeviceAnswers& device, const char* key)
{
    if (key == nullptr)
        return nullptr;
    const auto found = std::find_if(device.fAnswers.begin(), device.fAnswers.end(),
                                    [key](const Answer& answer) { return answer.fKey == key; });
    return found == device.fAnswers.end() || !found->IsKnown() ? nullptr : &*found;
}

std::string MakeText(const std::string& bytes)
{
    std::string text = ShowBytes(bytes);
    std::size_t size = 0;
    while (size < text.size()) {
        const std::size_t next = size + ReadCharacter(std::string_view(text).substr(size)).fSize;
        if (next > kMaxTextBytes)
            break;
        size = next;
    }
    text.resize(size);
    return text;
}

std::optional<Value> ReadScaled(const std::string& text, double scale)
{
    const auto number = ReadDouble(text);
    return number ? std::optional<Value>(*number * scale) : std::nullopt;
}

// Returns the value in the base unit of the key's form.
std::optional<Value> ReadValue(const Answer& answer)
{
    constexpr double kMebibyte = 1024.0 * 1024.0;
    const std::string& text = answer.fLine->fValue;
    switch (answer.fKnown->fForm) {
    case ValueForm::kText:
    case ValueForm::kAdapter:
    case ValueForm::kDate:
        return Value(MakeText(text));
    case ValueForm::kFlag:
        return text == "0" || text == "1" ? std::optional<Value>(text == "1") : std::nullopt;
    case ValueForm::kMebibytes:
        return ReadScaled(text, kMebibyte);
    case ValueForm::kCount:
    case ValueForm::kTexels:
    case ValueForm::kId:
    case ValueForm::kBytesPerSecond:
    case ValueForm::kScore:
        break;
    }
    return ReadScaled(text, 1);
}

// Returns the value of a fact that the report has no key for.
std::optional<Value> Judge(const FactKey& key, const DeviceAnswers& device)
{
    if (key.fName == kFailed)
        return Value(device.fFailed);
    if (key.fName == kSoftware)
        return CanTellSoftware(device) ? std::optional<Value>(!FindSoftwareText(device).empty())
                                       : std::nullopt;
    const std::string name = GetDeviceName(device);
    return name.empty() ? std::nullopt : std::optional<Value>(MakeText(name));
}

} // namespace

const std::vector<FactKey>& GetFactKeys()
{
    static const std::vector<FactKey> keys = {
        {kName, "Name of the adapter, or of the renderer without one.", nullptr, nullptr},
        {"vendor", "Vendor, as the driver has it.", "GLVendor", "CLVendor"},
        {"version", "Version of the interface.", "GLVersion", "CLDeviceVersion"},
        {"driver", "File or kernel module of the driver.", "GLDriver", nullptr},
        {"driver_version", "Version of the driver.", "GLDriverVersion", "CLDriverVersion"},
        {kFailed, "Whether a test of the device failed.", nullptr, nullptr},
        {kSoftware, "Whether the device is a software renderer.", nullptr, nullptr},
        {"integrated", "Whether the device is part of the processor.", "IsIntegratedGLGPU",
         "IsIntegratedCLGPU"},
        {"shaders_compile", "Whether a realistic pair of shaders compiles and links.",
         "CanCompileProgramGLSL", nullptr},
        {"framebuffers_work", "Whether a framebuffer object can be created and drawn to.",
         "GLFrameBufferOK", nullptr},
        {"memory_bytes", "Memory of the device.", "GLMemoryMB", "CLMemoryMB"},
        {"copy_bytes_per_second", "Measured speed of copies within the device.", nullptr,
         "CLBandwidth", false},
        {"compute_score", "Measured speed of computation; more is faster.", nullptr, "CLCompute",
         false},
    };
    return keys;
}

std::vector<DeviceFact> GetDeviceFacts(const DeviceAnswers& device)
{
    std::vector<DeviceFact> facts;
    for (const FactKey& key : GetFactKeys()) {
        const char* const name = device.fKind == DeviceKind::kOpenGL ? key.fGLKey : key.fCLKey;
        const bool isJudged = key.fGLKey == nullptr && key.fCLKey == nullptr;
        const Answer* const answer = Find(device, name);
        const auto value = isJudged            ? Judge(key, device)
                           : answer != nullptr ? ReadValue(*answer)
                                               : std::nullopt;
        if (value)
            facts.push_back({&key, *value});
    }
    return facts;
}

std::optional<std::uint64_t> GetDeviceCount(DeviceKind kind, const Answers& answers)
{
    const auto count =
        std::find_if(answers.fReport.begin(), answers.fReport.end(),
                     [kind](const Answer& answer) { return answer.fKey == GetCountKey(kind); });
    if (count->fMissing == Missing::kNoOpenCL)
        return 0;
    return count->IsKnown() ? ReadUnsigned(count->fLine->fValue) : std::nullopt;
}

const char* GetApiName(DeviceKind kind)
{
    return kind == DeviceKind::kOpenGL ? "opengl" : "opencl";
}

std::string MakeNumberText(double number)
{
    constexpr double kMaxExact = 9007199254740992.0; // 2^53
    if (std::trunc(number) == number && std::abs(number) <= kMaxExact)
        return fmt::format("{}", static_cast<std::int64_t>(number));
    return fmt::format("{}", number);
}

} // namespace assay_host
