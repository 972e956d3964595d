// One line of a report. A value type.
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

    // The line's bytes, unchanged, without the line end. A quoted value may contain line ends.
    std::string fText;

    // "\n", "\r\n", or empty if the report ended without one.
    std::string fLineEnd;

    // Bytes after fText were dropped by a limit of the reader.
    bool fCut = false;

    // Only of a kValue line: the text before and after the first '='. fValue is without the quotes;
    // a cut line has no closing quote to remove.
    std::string fKey;
    std::string fValue;
    bool fQuoted = false;
};

} // namespace assay_host
