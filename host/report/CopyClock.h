// Times the copies of the bandwidth measurement by the clock of the child's log, which is the
// system's, not the device's.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "report/ReportLine.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Reads the lines of the log and of the report in their order. One thread at a time.
class CopyClock {
public:
    // Any line is accepted.
    void Add(const ReportLine& line);

    // Returns a bound for each "TAG.CLBandwidth" so far that has a whole batch in the log.
    //
    // The bound is what was copied divided by the time from the first batch's start to the last
    // one's end. The device was busy for a part of this time at most, so it is at least as fast,
    // provided that its driver copied. The times are whole milliseconds: one is added, so that the
    // bound is none too high. A step of the system's clock in between makes it wrong.
    const std::vector<LowerBound>& GetBounds() const { return fBounds; }

private:
    void AddResult(const std::string& key);
    void AddLogText(std::string_view text, std::int64_t time);

    std::optional<std::int64_t> fStart; // of the first batch, in milliseconds of the day
    std::int64_t fEnd = 0;              // of the last batch
    int fBatches = 0;
    std::vector<LowerBound> fBounds;
};

} // namespace assay_host
