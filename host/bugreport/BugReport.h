// The files of a bug report, for a driver's developers or for ours.
#pragma once

#include <string>
#include <vector>

#include "bugreport/KernelLog.h"
#include "bugreport/Mask.h"
#include "identity/Identity.h"
#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"

namespace assay_host {

// What was collected, as it came.
struct BugReportData {
    Report fReport;
    RunOutcome fOutcome;
    RunFacts fFacts;
    std::vector<std::string> fLog; // all lines of standard output, with those of the log
    Identity fIdentity;
    KernelLog fKernel;
};

struct BugReportFile {
    std::string fName;
    std::string fWhat;   // a phrase for its line in a list
    std::string fText;   // UTF-8 where the sources are
    std::string fReason; // why what it should have isn't known; empty if it is
};

// Returns the files without their texts, in the order of MakeBugReport().
const std::vector<BugReportFile>& ListBugReport();

// Returns the files, with the secrets hidden. README.txt is the first: it lists the others, and
// names what is missing with its reason. Any thread may call.
std::vector<BugReportFile> MakeBugReport(BugReportData data, const Mask& mask);

} // namespace assay_host
