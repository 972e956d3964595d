// How a supervised run of the child ended. A value type.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "report/LoadedFiles.h"

namespace assay_host {

enum class Verdict {
    kComplete,     // a whole report, and no test failed
    kFailedTests,  // the child ended by itself, but tests failed or the report isn't whole
    kUsageError,   // the child rejected its command line
    kCrashed,      // a signal ended the child; on Windows, an exit code above 255
    kHung,         // the timeout expired and the child was killed
    kNeverStarted, // the child could not be started
    kInterrupted   // the run was interrupted and the child was killed
};

// Returns "complete", "failed-tests", "usage-error", "crashed", "hung", "never-started" or
// "interrupted".
const char* GetVerdictName(Verdict verdict);

// Returns the exit status of `assay-host run` for the verdict: 0 to 6 in the order above.
int GetVerdictStatus(Verdict verdict);

// The cause of a failure, from the child's log.
struct Cause {
    std::string fKey;  // of the report line that the failure belongs to, with its tag
    std::string fText; // raw bytes, without the log's prefix
};

// What a measurement must at least be, by another clock than the device's.
struct LowerBound {
    std::string fKey; // with its tag: "clgpu[0].CLBandwidth"
    double fValue;    // in the unit of the key
};

struct RunOutcome {
    Verdict fVerdict = Verdict::kNeverStarted;
    std::vector<std::string> fCommand; // the child's path and its options
    std::optional<int> fExitStatus;    // empty if the child didn't end by itself
    std::string fTermination;    // of a crash: "signal 11 (Segmentation fault)", "code 0xC0000005"
    std::string fReason;         // one sentence for the user
    double fSeconds = 0;         // from the launch to the child's end
    double fTimeoutSeconds = 0;  // 0 without a limit
    std::string fLastReportLine; // raw bytes; empty if there is none
    std::string fLastLogLine;    // raw bytes; empty if none came after the last report line
    std::vector<std::string> fErrorLines; // raw lines of standard error, without line ends
    std::uint64_t fLostOutputBytes = 0;   // dropped by a limit
    std::uint64_t fLostErrorBytes = 0;
    std::vector<Cause> fCauses;           // in the order of the log; empty if the child kept none
    std::vector<LowerBound> fLowerBounds; // as CopyClock returns them; empty without a log
    LoadedFiles fDrivers{{}, "the child was not started"};
    bool fLeftBehind = false; // a process could not be killed and may still be running

    // Returns the text of the first cause of this key; empty without one.
    std::string FindCause(const std::string& key) const;

    // Returns the bound of this key; 0 without one.
    double FindLowerBound(const std::string& key) const;
};

} // namespace assay_host
