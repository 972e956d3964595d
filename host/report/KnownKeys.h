// The lines that a whole report has, in the order in which it prints them: the one table of what
// docs/report-format.md describes. Who reads, shows, compares or predicts a report goes by it.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

enum class DeviceKind { kOpenGL, kOpenCL };

// "OpenGL", "OpenCL".
const char* GetKindName(DeviceKind kind);

// The word of a tag: "glgpu", "clgpu".
const char* GetTagWord(DeviceKind kind);

// A device's tag: "glgpu[0]", "clgpu[1]".
std::string MakeTag(DeviceKind kind, std::size_t index);

// The report's key with their number: "NumGLGPUs", "NumCLGPUs".
const char* GetCountKey(DeviceKind kind);

// More devices of a kind than any machine has; a child that makes up more costs no more memory.
constexpr std::size_t kMaxDevices = 256;

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

// What two runs of one machine have in common of the value.
enum class Match {
    kExact,   // all of it
    kStamp,   // a time between quotes
    kInteger, // a memory size, while other programs come and go
    kNumber   // a measurement
};

struct KnownKey {
    std::optional<DeviceKind> fKind; // of the devices that have it; none for the report's own
    std::string fKey;                // after the tag and its point

    // For people, of a device's key: its label, its form, and in the group kMain its row among
    // them.
    std::string fLabel;
    ValueForm fForm = ValueForm::kText;
    KeyGroup fGroup = KeyGroup::kMain;
    int fRow = 0;

    Match fMatch = Match::kExact;

    // The gputag lines in front of the answer; fTagsFirst: they come before the driver is asked,
    // and so even if that fails.
    std::vector<std::string> fTagLines{};
    bool fTagsFirst = false;

    // A device takes the step without a line where it has no value, and always where its key of
    // this name is 0; empty for a key that each device prints.
    std::string fSilentWithout{};

    bool fTakesStep = true;

    bool MayBeSilent() const { return !fSilentWithout.empty(); }

    // What stands before the '=' for the device of that tag; the key alone for an empty tag.
    std::string GetKey(const std::string& tag) const;
};

// A part of a constant array, as a range.
template <typename T>
struct Table {
    const T* fBegin;
    std::size_t fSize;

    const T* begin() const { return fBegin; }
    const T* end() const { return fBegin + fSize; }
    std::size_t size() const { return fSize; }
    const T& operator[](std::size_t index) const { return fBegin[index]; }
};

// All of them: a device's key stands for the lines of all devices of its kind, one after the other.
const std::vector<KnownKey>& GetKnownKeys();

// Those of them that each device of the kind has.
Table<KnownKey> GetDeviceKeys(DeviceKind kind);

// Those of them that belong to no device.
const std::vector<const KnownKey*>& GetReportKeys();

// The key of that name that devices of the kind have, or the report itself; null if there is none.
const KnownKey* FindKnownKey(std::optional<DeviceKind> kind, std::string_view name);

} // namespace assay_host
