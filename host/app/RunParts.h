// What a single run and a series have in common.
#pragma once

#include <string>

#include "app/CommandLine.h"
#include "output/WriterThread.h"
#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"
#include "report/StoredRun.h"

namespace assay_host {

// Collects the facts that the format has.
RunFacts MakeRunFacts(const RunChoice& choice, const std::string& program);

// Returns the exit status of a run: that of its verdict, or of what is needed.
int GetRunStatus(Need need, const Report& report, const RunOutcome& outcome);

// Queues the form of a run that was asked for.
void WriteRun(WriterThread& writer, const RunChoice& choice, StoredRun run);

} // namespace assay_host
