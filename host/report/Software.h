// Recognises renderers that draw or compute on the processor.
#pragma once

#include <string>
#include <string_view>

#include "report/Answers.h"

namespace assay_host {

// Whether a name that a driver, a device or an adapter gives itself is that of a software renderer.
// Compares ASCII letters without regard to case.
bool IsSoftwareName(std::string_view name);

// Whether the OpenCL version text of a device is that of a processor that PoCL drives. PoCL on a
// graphics card is none.
bool IsSoftwareVersion(std::string_view version);

// The device's text that shows it to be a software renderer, as it came: a renderer, an adapter, a
// device or a version. Empty if none does.
std::string FindSoftwareText(const DeviceAnswers& device);

// Whether the device has answered what FindSoftwareText() goes by.
bool CanTellSoftware(const DeviceAnswers& device);

} // namespace assay_host
