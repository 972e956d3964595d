// The verdict on a run, from what was seen of it.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "report/ReportLine.h"
#include "report/RunOutcome.h"
#include "report/SequenceReader.h"
#include "supervise/WatchedLauncher.h"

namespace assay_host {

// What the report has shown, line by line.
class ReportProgress {
public:
    void Add(const ReportLine& line);

    bool HasValues() const { return fHasValues; }
    bool IsWhole() const { return fHasStart && fHasEnd; }
    const std::string& GetLastReportLine() const { return fLastReportLine; }
    const std::string& GetLastKey() const { return fLastKey; }
    const std::string& GetLastLogLine() const { return fLastLogLine; }
    const SequenceReader& GetSequence() const { return fSequence; }

private:
    bool fHasValues = false;
    bool fHasStart = false;
    bool fHasEnd = false;
    std::string fLastReportLine;
    std::string fLastKey;
    std::string fLastLogLine;
    SequenceReader fSequence;
};

// Why the host ended the child.
enum class KillReason { kNone, kTimeout, kInterrupt };

struct Evidence {
    std::string fStartFailure;    // why there was no child; empty if there was one
    std::optional<ChildEnd> fEnd; // nothing if the child's end wasn't seen
    std::string fTermination;     // what ended it, if it didn't itself
    KillReason fKillReason = KillReason::kNone;
    ReportProgress fReport;
};

// Fills in the verdict, the exit status, the termination, the reason and the last lines. Takes the
// options and the error lines from the outcome.
void Judge(const Evidence& evidence, RunOutcome& outcome);

// What the options make the child's main return with -exit=; the last one counts.
std::int32_t GetAskedStatus(const std::vector<std::string>& options);

} // namespace assay_host
