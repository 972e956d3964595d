// Takes a report apart while it arrives. Any bytes may come, in pieces of any size: nothing throws,
// each byte is looked at a bounded number of times, and no more than the limits is held.
//
// A quoted value that isn't closed on its line goes on behind the line end, up to the line that
// ends with a quote; unless a line in between begins like one of the report's own, the value grows
// longer than a line may be, or the data ends: then each of those lines stands alone, the open one
// raw.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "report/ReportLine.h"

namespace assay_host {

class ReportReader {
public:
    struct Limits {
        // A line that is longer is cut there; the rest of it is lost and counted.
        std::size_t fMaxLineBytes = std::size_t{1} << 16;
        // What comes behind so many bytes is lost and counted.
        std::uint64_t fMaxBytes = std::uint64_t{4} << 20;
        // What comes behind so many lines is lost and counted: each costs memory, however short.
        std::size_t fMaxLines = std::size_t{24} << 10;
    };

    ReportReader() = default;
    explicit ReportReader(const Limits& limits) : fLimits(limits) {}

    // The lines that these bytes complete, in order.
    std::vector<ReportLine> Feed(std::string_view bytes);

    // What is left at the end of the data. The reader is then as new, but for its counts.
    std::vector<ReportLine> Finish();

    // How many bytes came in all, and how many of them were lost to the limits.
    std::uint64_t GetByteCount() const { return fBytes; }
    std::uint64_t GetLostByteCount() const { return fLost; }

private:
    using Lines = std::vector<ReportLine>;

    void Append(std::string_view piece);
    void Hold(std::string_view piece);
    void EndLine(const std::string& lineEnd, Lines& lines);
    void ReleaseOpenQuote(Lines& lines);

    // A line of an open quote.
    struct OpenLine {
        std::string fText;
        std::string fLineEnd;
    };

    Limits fLimits;
    std::uint64_t fBytes = 0;
    std::uint64_t fLost = 0;
    std::size_t fLineCount = 0;

    // The line under way. A carriage return is held apart until it is known what follows it.
    std::string fText;
    bool fCarriageReturn = false;
    bool fCut = false;

    // The lines since a quote was opened.
    std::vector<OpenLine> fQuote;
    std::size_t fQuoteBytes = 0;
};

} // namespace assay_host
