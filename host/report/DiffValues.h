// The texts of a difference, for all forms. All are safe to write to a terminal. Any thread may
// call.
#pragma once

#include <string>

#include "report/Comparison.h"

namespace assay_host {

// One side of a difference.
struct DiffValue {
    bool fIsThere = false;
    std::string fBytes; // as the report has it, without its quotes; any bytes
    std::string fValue; // the same, safe and with its quotes; "missing (REASON)"
    std::string fText;  // for people, with its unit; if it isn't there, the reason
};

DiffValue GetValueBefore(const Difference& difference);
DiffValue GetValueAfter(const Difference& difference);

// Returns the tag of the device in the first report, or in the second one if only that has it.
// Empty without a device.
std::string GetDiffTag(const Difference& difference);

// Returns the key without the device's tag: that of an answer, or "verdict", "opengl.usable". Empty
// for a difference of a device.
std::string GetDiffKey(const Difference& difference);

// Returns the name for people: "Memory", "Verdict", "Device".
std::string GetDiffLabel(const Difference& difference);

// Returns a text such as `glgpu[0] "Accelerator 4000"`.
std::string GetDeviceText(const DeviceAnswers& device);

// Returns an identifier such as "measurements".
const char* GetDiffGroupName(DiffGroup group);

} // namespace assay_host
