// Reads and compares lines in tests, and prints them when a test fails.
#pragma once

#include <algorithm>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

#include "report/Report.h"
#include "report/ReportLine.h"
#include "report/ReportReader.h"

namespace assay_host {

inline bool operator==(const ReportLine& a, const ReportLine& b)
{
    return a.fKind == b.fKind && a.fText == b.fText && a.fLineEnd == b.fLineEnd &&
           a.fCut == b.fCut && a.fKey == b.fKey && a.fValue == b.fValue && a.fQuoted == b.fQuoted;
}

inline std::ostream& operator<<(std::ostream& out, const ReportLine& line)
{
    constexpr const char* kKinds[] = {"value", "comment", "raw"};
    return out << kKinds[static_cast<int>(line.fKind)] << (line.fCut ? " cut" : "") << " {"
               << line.fText << "} end " << line.fLineEnd.size() << " key {" << line.fKey
               << "} value {" << line.fValue << (line.fQuoted ? "} quoted" : "}");
}

// Reads all lines of a text that arrives in pieces of this size.
inline std::vector<ReportLine> ReadLines(std::string_view text, std::size_t piece = 1 << 20,
                                         const ReportReader::Limits& limits = {})
{
    ReportReader reader(limits);
    std::vector<ReportLine> lines;
    const auto add = [&lines](std::vector<ReportLine> more) {
        lines.insert(lines.end(), more.begin(), more.end());
    };
    for (; !text.empty(); text.remove_prefix(std::min(piece, text.size())))
        add(reader.Feed(text.substr(0, piece)));
    add(reader.Finish());
    return lines;
}

inline Report ReadReport(std::string_view text)
{
    Report report;
    report.Add(ReadLines(text));
    return report;
}

} // namespace assay_host
