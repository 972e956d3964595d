// One run of the child for a host: calls its callbacks, and ends by its stop.
#pragma once

#include "library/Options.h"
#include "report/Report.h"
#include "report/RunOutcome.h"
#include "supervise/ChildRun.h"

namespace assay_host {

struct SessionEnd {
    Report fReport;
    RunOutcome fOutcome;
};

// Returns the options of the child, with the default program if none is set.
ChildOptions MakeChildOptions(const assay_host_options& options);

// Runs the child of `child` with the callbacks of `options`. Throws only what RunChild() throws.
SessionEnd RunSession(const assay_host_options& options, const ChildOptions& child,
                      assay_host_stop* stop);

} // namespace assay_host
