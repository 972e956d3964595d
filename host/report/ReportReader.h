// Splits a report into lines while it arrives. Accepts any bytes in pieces of any size, throws only
// if memory runs out, reads each byte a bounded number of times, and holds no more than the limits.
//
// A quoted value without its closing quote continues on the next lines, up to a line that ends with
// a quote. If a line that begins like a line of the report comes first, the value exceeds
// fMaxLineBytes, or the data ends, each of these lines is returned by itself, the first as a raw
// one.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "report/ReportLine.h"

namespace assay_host {

// One thread at a time.
class ReportReader {
public:
    // Bytes beyond a limit are dropped and counted. The report of a machine with 256 devices of
    // each kind has 17928 lines.
    struct Limits {
        std::size_t fMaxLineBytes = std::size_t{1} << 16; // without the line end
        std::uint64_t fMaxBytes = std::uint64_t{4} << 20; // of the whole report, without what is
                                                          // cut from long lines
        std::size_t fMaxLines = std::size_t{24} << 10;    // bounds the memory that short lines cost
    };

    ReportReader() = default;
    explicit ReportReader(const Limits& limits) : fLimits(limits) {}

    // Returns the lines that these bytes complete, in order.
    std::vector<ReportLine> Feed(std::string_view bytes);

    // Call at the end of the data. Returns the lines that are left. Only the counts are kept.
    std::vector<ReportLine> Finish();

    // Returns the number of bytes fed so far.
    std::uint64_t GetByteCount() const { return fBytes; }

    // Returns the number of bytes dropped so far.
    std::uint64_t GetLostByteCount() const { return fLost; }

private:
    using Lines = std::vector<ReportLine>;

    std::size_t GetLineRoom() const;
    std::uint64_t GetRoom() const;
    std::size_t GetTakenSize(std::size_t size) const;
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
    std::uint64_t fKept = 0; // without a carriage return that is kept out of fText
    std::size_t fLineCount = 0;

    // The current line. A carriage return is kept out of it until the next byte is known.
    std::string fText;
    bool fCarriageReturn = false;
    bool fCut = false;

    // The lines since a quote was opened.
    std::vector<OpenLine> fQuote;
    std::size_t fQuoteBytes = 0;
};

} // namespace assay_host
