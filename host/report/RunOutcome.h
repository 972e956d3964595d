// How a supervised run of the child ended. A value type.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace assay_host {

enum class Verdict {
    kComplete,     // a whole report, and no test failed
    kFailedTests,  // the child ended by itself, but tests failed or the report isn't whole
    kUsageError,   // the child refused its command line
    kCrashed,      // the child died of a signal, or with a code above 255
    kHung,         // the time ran out and the child was killed
    kNeverStarted, // there was no child
    kInterrupted   // the host was told to stop, and ended the child
};

// "complete", "failed-tests", "usage-error", "crashed", "hung", "never-started",
// "interrupted".
const char* GetVerdictName(Verdict verdict);

// The exit status of `assay-host run` for it: 0 to 6 in the order above. (A trouble of
// the host's own, its command line or its output, is 10.)
int GetVerdictStatus(Verdict verdict);

struct RunOutcome {
    Verdict fVerdict = Verdict::kNeverStarted;
    std::vector<std::string> fCommand; // the child's path and its options
    std::optional<int> fExitStatus;    // where the child ended by itself
    std::string fTermination;    // of a crash: "signal 11 (Segmentation fault)", "code 0xC0000005"
    std::string fReason;         // one sentence for people
    double fSeconds = 0;         // from the launch to the end
    double fTimeoutSeconds = 0;  // what was allowed; 0 without a limit
    std::string fLastReportLine; // as it came; empty without one
    std::string fLastLogLine;    // as it came, if it is behind the last report line
    std::vector<std::string> fErrorLines; // standard error, as it came, without line ends
    std::uint64_t fLostOutputBytes = 0;   // cut from a flood
    std::uint64_t fLostErrorBytes = 0;
    bool fLeftBehind = false; // a process that couldn't be ended may be left
};

} // namespace assay_host
