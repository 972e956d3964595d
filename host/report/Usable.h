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
    kBroken,   // something is there, and it crashed, hung or failed its trials
    kAbsent,   // the library or every device is missing
    kUnknown   // the run says nothing of it
};

// Returns "hardware", "software", "broken", "absent" or "unknown".
const char* GetUsabilityName(Usability usability);

// Returns the exit status of `assay-host run --need` for it: 0 for hardware, 20 to 23 for the
// others in the order above. None is the status of a verdict.
int GetUsabilityStatus(Usability usability);

// The answer for a host that needs both: the one that leaves less. Broken leaves least, then
// absent, unknown, software and hardware.
Usability GetLesser(Usability first, Usability second);

struct Usable {
    Usability fUsability = Usability::kUnknown;
    const char* fReason = ""; // a stable word for programs
    std::string fText;        // one sentence for people, safe to write to a terminal
    std::string fTag;         // the device that the answer is about; empty for none
};

// The answer for one interface. An outcome without a command, as of a report from a file, is taken
// for what its verdict says. Any thread may call.
Usable JudgeUsable(DeviceKind kind, const Answers& answers, const RunOutcome& outcome);

} // namespace assay_host
