// Reads single lines of a report by their form. Any thread may call.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

#include "report/KnownKeys.h"
#include "report/ReportLine.h"

namespace assay_host {

// Reads a line by itself. `text`: the line without its end. `cut`: bytes were lost at its end, so
// that a quoted value need not end with a quote.
ReportLine ReadLine(std::string text, std::string lineEnd, bool cut);

// Whether the line is a value that has its line end and lost no bytes.
bool IsWholeValue(const ReportLine& line);

// Whether the line is a quoted value that has its line end and lost no bytes, as a time stamp must.
bool IsStamp(const ReportLine& line);

// Whether the line is key="value without its closing quote.
bool LeavesQuoteOpen(std::string_view text);

// Whether the line begins like a line of the report, so that it isn't taken for part of a quoted
// value: a comment, a key with a device's tag, a gputag line, or a known key without a tag.
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
