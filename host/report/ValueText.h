// Values in the text form. Any thread may call.
#pragma once

#include <string>

#include "report/Answers.h"

namespace assay_host {

// Returns the value with its unit, safe to write to a terminal: "4 GiB", "0x10DE (4318)", "yes". A
// value that doesn't have the form of its key is shown as it is, one that isn't known as "not known
// (REASON)", a missing one as "- (REASON)". Never empty.
std::string GetValueText(const Answer& answer);

// Returns the device's name: the adapter's if there is one, otherwise the renderer's. The bytes are
// unchanged; the name may be empty.
std::string GetDeviceName(const DeviceAnswers& device);

} // namespace assay_host
