// The keys that a whole report has, in the order in which it prints them.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace assay_host {

enum class DeviceKind { kOpenGL, kOpenCL };

// "OpenGL", "OpenCL".
const char* GetKindName(DeviceKind kind);

// The word of a tag: "glgpu", "clgpu".
const char* GetTagWord(DeviceKind kind);

// The report's key with their number: "NumGLGPUs", "NumCLGPUs".
const char* GetCountKey(DeviceKind kind);

// What a value is, which is to say how a person likes to read it.
enum class ValueForm {
    kText,
    kAdapter,
    kDate,
    kFlag,
    kCount,
    kTexels,
    kMebibytes,
    kId,
    kBytesPerSecond,
    kScore
};

enum class KeyGroup { kMain, kLimit, kExtension };

struct KnownKey {
    const char* fKey;   // behind the tag and its point
    const char* fLabel; // for people
    ValueForm fForm;
    KeyGroup fGroup;
};

// A constant array, as a range.
template <typename T>
struct Table {
    const T* fBegin;
    std::size_t fSize;

    const T* begin() const { return fBegin; }
    const T* end() const { return fBegin + fSize; }
    std::size_t size() const { return fSize; }
    const T& operator[](std::size_t index) const { return fBegin[index]; }
};

Table<KnownKey> GetDeviceKeys(DeviceKind kind);

// The keys of the report itself, without the devices' ones. NumCLGPUs and what follows it comes
// behind the OpenGL devices.
Table<const char*> GetReportKeys();

// A device that goes through its tests without this key has none to print.
constexpr std::string_view kOptionalKey = "CUDAVersion";

} // namespace assay_host
