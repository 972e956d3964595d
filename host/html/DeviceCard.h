// A device on the page of a run.
#pragma once

#include "html/Markup.h"
#include "report/Answers.h"

namespace assay_host {

// Adds an article: the facts, the trials, what is missing, and the limits and extensions folded.
void AddDeviceCard(Markup& page, const DeviceAnswers& device);

} // namespace assay_host
