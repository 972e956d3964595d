// Detects software renderers: OpenGL and OpenCL on the processor. Any thread may call.
#pragma once

#include <string>
#include <string_view>

#include "report/Answers.h"

namespace assay_host {

// Whether the name of a driver, a device or an adapter is that of a software renderer. Ignores the
// case of ASCII letters.
bool IsSoftwareName(std::string_view name);

// Whether the OpenCL version text of a device is that of PoCL on a processor. PoCL also has drivers
// for graphics cards.
bool IsSoftwareVersion(std::string_view version);

// Returns the value that shows the device to be a software renderer, unchanged: its renderer, its
// adapter, its name or its version. Empty if none does.
std::string FindSoftwareText(const DeviceAnswers& device);

// Whether the device has the values that FindSoftwareText() checks.
bool CanTellSoftware(const DeviceAnswers& device);

} // namespace assay_host
