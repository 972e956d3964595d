// The forms that a line of a report has.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

#include "report/KnownKeys.h"
#include "report/ReportLine.h"

namespace assay_host {

// The line that these bytes are when they stand alone. `cut`: bytes were lost at its end, so that a
// quote may lack its partner.
ReportLine ReadLine(std::string text, std::string lineEnd, bool cut);

// Whether the line is a complete value: it has its line end, and nothing was cut from it.
bool IsWholeValue(const ReportLine& line);

// Whether the line is a time stamp, quotes, line end and all.
bool IsStamp(const ReportLine& line);

// Whether the line is key=value with a quote that isn't closed.
bool LeavesQuoteOpen(std::string_view text);

// Whether the line can't be the inside of a quoted value, because it begins as lines of the report
// do: a comment, a tagged key, a code of a constant, or one of the report's own keys.
bool BeginsLikeReportLine(std::string_view text);

// What a device's tag says.
struct DeviceTag {
    DeviceKind fKind;
    std::size_t fIndex;
};

// Reads "glgpu[0]". Returns nothing if the text is anything else, or more than a tag.
std::optional<DeviceTag> ReadDeviceTag(std::string_view text);

// Returns "glgpu[0]" for "glgpu[0].GLName", and nothing for a key without a device's tag.
std::optional<std::string_view> GetDeviceTag(std::string_view key);

} // namespace assay_host
