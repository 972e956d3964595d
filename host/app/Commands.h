// The commands. Each returns the exit status and throws std::runtime_error for an error in its
// input or output. Call on the main thread, once in a process.
#pragma once

#include "app/CommandLine.h"

namespace assay_host {

int Run(const RunChoice& choice);
int Torture(const TortureChoice& choice);
int Diff(const DiffChoice& choice);
int Show(const ShowChoice& choice);
int BugReport(const BugReportChoice& choice);
int Explain(const ExplainChoice& choice);
int Check(const CheckChoice& choice);
int CheckState(const CheckChoice& choice); // what Check() does for a folder of the state
int Advise(const AdviseChoice& choice);
int State(const StateChoice& choice);

} // namespace assay_host
