// The facts of a document besides the report and the outcome: the programs, the system and the
// time. Value types.
#pragma once

#include <string>

namespace assay_host {

// A text that may not be known.
struct Fact {
    std::string fValue;  // UTF-8, or any bytes if the system has them
    std::string fReason; // why the value is not known; empty if it is

    bool IsKnown() const { return fReason.empty(); }
};

struct Environment {
    Fact fSystem;        // "Debian GNU/Linux 12 (bookworm)"
    Fact fBuild;         // of the system: "19045.3803"
    Fact fKernel;        // "Linux 6.1.0-13-amd64"
    Fact fArchitecture;  // of the machine: "x86_64"
    Fact fHost;          // the machine's name
    std::string fTime;   // UTC, "2026-11-22T01:26:02Z"
    std::string fOffset; // of the local time from UTC: "+01:00"
};

struct RunFacts {
    std::string fHostVersion; // assay-host's
    Fact fChildVersion;       // the child's, from its file
    Environment fEnvironment;
};

} // namespace assay_host
