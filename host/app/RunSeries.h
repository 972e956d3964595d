// The run of a series, with --repeat or --for.
#pragma once

#include <memory>

#include "app/CommandLine.h"
#include "output/WriterThread.h"
#include "pmutil/StopRequest.h"
#include "supervise/ChildRun.h"

namespace assay_host {

// Runs the child until the plan is done, `stop` is raised, or another run would end the same way:
// after a child that can't be started or rejects its options. Crashes and timeouts don't end the
// series. Writes the form, and returns the exit status: that of the worst run. For the main thread.
int RunSeries(const RunChoice& choice, const ChildOptions& options,
              const std::shared_ptr<WriterThread>& writer, pmutil::StopRequest& stop);

} // namespace assay_host
