// The table of the report's keys, in the order in which a whole report prints them, as described in
// docs/report-format.md. All code that reads, shows, compares or predicts a report uses it.
//
// All functions here may be called by any thread.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

enum class DeviceKind { kOpenGL, kOpenCL };

// Returns "OpenGL" or "OpenCL".
const char* GetKindName(DeviceKind kind);

// Returns the word that a device's tag begins with: "glgpu" or "clgpu".
const char* GetTagWord(DeviceKind kind);

// Returns a device's tag: "glgpu[0]", "clgpu[1]".
std::string MakeTag(DeviceKind kind, std::size_t index);

// Returns the key of the number of devices of the kind: "NumGLGPUs" or "NumCLGPUs".
const char* GetCountKey(DeviceKind kind);

// Devices of one kind that are read. No machine has as many; the limit bounds the memory that an
// invented count can cost.
constexpr std::size_t kMaxDevices = 256;

// How the text form shows a value.
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

// How far the values of two runs on one machine must agree.
enum class Match {
    kExact,   // byte by byte
    kStamp,   // both are quoted times
    kInteger, // both are integers: a memory size depends on other programs
    kNumber   // both are numbers: a measurement
};

struct KnownKey {
    std::optional<DeviceKind> fKind; // of the devices that have it; none for a key without a tag
    std::string fKey;                // without the tag and its point

    // For the text form of a device's key. fRow orders the keys of the group kMain.
    std::string fLabel;
    ValueForm fForm = ValueForm::kText;
    KeyGroup fGroup = KeyGroup::kMain;
    int fRow = 0;

    Match fMatch = Match::kExact;

    // The gputag lines that precede the key's line. With fTagsFirst they are printed before the
    // driver is called, and so even if the call fails.
    std::vector<std::string> fTagLines{};
    bool fTagsFirst = false;

    // Empty for a key that every device prints. Otherwise a device may take the step without
    // printing a line, and always does if its key of this name is 0.
    std::string fSilentWithout{};

    // The value is worked out from the system's adapter lists alone.
    bool fNeedsAdapter = false;

    bool fTakesStep = true;

    bool MayBeSilent() const { return !fSilentWithout.empty(); }

    // Returns "TAG.KEY", or the key alone if the tag is empty.
    std::string GetKey(const std::string& tag) const;
};

// A range of a constant array.
template <typename T>
struct Table {
    const T* fBegin;
    std::size_t fSize;

    const T* begin() const { return fBegin; }
    const T* end() const { return fBegin + fSize; }
    std::size_t size() const { return fSize; }
    const T& operator[](std::size_t index) const { return fBegin[index]; }
};

// Returns all keys. A device's key is there once, for the lines of all devices of its kind.
const std::vector<KnownKey>& GetKnownKeys();

// Returns the keys of the devices of the kind: a range of GetKnownKeys().
Table<KnownKey> GetDeviceKeys(DeviceKind kind);

// Returns the keys without a tag: pointers into GetKnownKeys().
const std::vector<const KnownKey*>& GetReportKeys();

// Finds a device's key by its name without the tag, or, without a kind, a key that has no tag.
// Returns null if there is no such key.
const KnownKey* FindKnownKey(std::optional<DeviceKind> kind, std::string_view name);

} // namespace assay_host
