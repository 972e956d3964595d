// Takes a report apart while it arrives. Any bytes may come, in pieces of any size: nothing throws,
// each byte is looked at a bounded number of times, and no more than the limits is held.
//
// A quoted value that isn't closed on its line goes on behind the line end, up to the line that ends
// with a quote; unless a line in between begins like one of the report's own, in which case the open
// line stands alone, raw.
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
        std::uint64_t fMaxBytes = std::uint64_t{16} << 20;
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
    Limits fLimits;
    std::uint64_t fBytes = 0;
    std::uint64_t fLost = 0;
    std::string fOpen;
};

} // namespace assay_host
