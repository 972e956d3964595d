// What the forms for fleets tell of a device: names, kinds and units are the same in all of them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <variant>
#include <vector>

#include "report/Answers.h"

namespace assay_host {

// A driver may return 64 KiB. Longer texts are cut after a whole character.
constexpr std::size_t kMaxTextBytes = 200;

// A kind of fact.
struct FactKey {
    // For metrics, labels and members: lower case, with the unit at its end if there is one.
    const char* fName;
    const char* fHelp;
    const char* fGLKey; // without the tag; null if OpenGL devices don't have it
    const char* fCLKey;
    bool fIsStable = true; // false for a measurement, which differs from run to run
};

struct DeviceFact {
    const FactKey* fKey;
    // A text as ShowBytes() returns it, of at most kMaxTextBytes; a number in the unit of the name;
    // or a flag.
    std::variant<std::string, double, bool> fValue;
};

// Returns all kinds of facts, in the order of every form.
const std::vector<FactKey>& GetFactKeys();

// Returns what is known of the device, in the order of GetFactKeys(). A value that is missing or
// stands for "not known" is left out.
std::vector<DeviceFact> GetDeviceFacts(const DeviceAnswers& device);

// Returns the number of devices of the kind, as the report has it; nothing if it isn't known.
// Without an OpenCL library it is 0.
std::optional<std::uint64_t> GetDeviceCount(DeviceKind kind, const Answers& answers);

// Returns "opengl" or "opencl".
const char* GetApiName(DeviceKind kind);

// Returns a number without an exponent if it is an integer that a double holds exactly, otherwise
// with as many digits as needed to read the same double.
std::string MakeNumberText(double number);

} // namespace assay_host
