// Whether a host application can use OpenGL and OpenCL on the machine, judged in one place for
// every form of a run. docs/assay-host.md has the rules as a table.
#pragma once

#include <string>

#include "report/Answers.h"
#include "report/RunOutcome.h"

namespace assay_host {

enum class Usability {
    kHardware, // a device with graphics hardware passed its trials
    kSoftware, // only software renderers did
    kBroken,   // the library or a device exists, but crashed, hung or failed its trials
    kAbsent,   // there is no library or no device
    kUnknown   // the run doesn't show it
};

// Returns "hardware", "software", "broken", "absent" or "unknown".
const char* GetUsabilityName(Usability usability);

// Returns the exit status of `assay-host run --need` for it: 0 for hardware, 20 to 23 for the
// others in the order above. None is the status of a verdict.
int GetUsabilityStatus(Usability usability);

// Returns the worse one of two, for a host that needs both. The order is broken, absent, unknown,
// software, hardware, from the worst to the best.
Usability GetLesser(Usability first, Usability second);

struct Usable {
    Usability fUsability = Usability::kUnknown;
    const char* fReason = ""; // a stable identifier for programs
    std::string fText;        // one sentence for the user, safe to write to a terminal
    std::string fTag;         // of the device that decided; empty for none
};

// Judges one interface. Any thread may call.
Usable JudgeUsable(DeviceKind kind, const Answers& answers, const RunOutcome& outcome);

} // namespace assay_host
