// Reads what the child's log says of a run.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "report/RunOutcome.h"
#include "report/SequenceReader.h"

namespace assay_host {

// Takes the causes of failures and the files of the drivers into an outcome. One thread at a time.
class RunLog {
public:
    // Takes the text of a log line. `sequence` has read the report up to this line, without it.
    // Returns whether the line is about the drivers' files.
    bool Add(std::string_view text, const SequenceReader& sequence, RunOutcome& outcome);

    // Call at the end of the run. The child writes why a device's test failed to standard error
    // alone: the n-th of these lines belongs to the n-th device that failed. Takes them as causes,
    // unless lines are missing or others look the same.
    void Finish(RunOutcome& outcome) const;

private:
    std::vector<std::string> fFailedKeys; // one for each failed device; empty if not known
};

// Whether a line of standard error is that of a failed test or of an exception that ended the
// child: "QGF::LogicalException: TEXT", "exception: TEXT" or "unknown exception".
bool IsFailureLine(const std::string& line);

} // namespace assay_host
