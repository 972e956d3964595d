// Values as people like to read them.
#pragma once

#include <string>

#include "report/Answers.h"

namespace assay_host {

// The answer's value in a sensible unit ("4 GiB", "0x10DE (4318)", "yes"), for a terminal; what has
// another form than its key is shown as it came. Of a missing one "- (REASON)".
std::string GetValueText(const Answer& answer);

// A device's name for people: the adapter's, else the renderer's, as it came. May be empty.
std::string GetDeviceName(const DeviceAnswers& device);

} // namespace assay_host
