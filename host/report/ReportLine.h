// One line of a report, as its reader takes it apart. A value type.
#pragma once

#include <string>

namespace assay_host {

enum class LineKind {
    kValue,   // key=value
    kComment, // begins with '#': a log line, or a comment that the caller asked for
    kRaw      // anything else, kept as it came
};

struct ReportLine {
    LineKind fKind = LineKind::kRaw;

    // The line's bytes as they came, without the line end. A quoted value may hold line ends of its
    // own; these are in here as they came.
    std::string fText;

    // How the line ended: "\n", "\r\n", or nothing where the report broke off.
    std::string fLineEnd;

    // Bytes behind fText were lost to the reader's limits.
    bool fCut = false;

    // Of a kValue line: what stands before the first '=', and what stands behind it. A quoted value
    // is without its two quotes, or without its first one if the line is cut.
    std::string fKey;
    std::string fValue;
    bool fQuoted = false;
};

} // namespace assay_host
