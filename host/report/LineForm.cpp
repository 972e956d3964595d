#include "report/LineForm.h"

#include <algorithm>
#include <utility>

#include "report/Numbers.h"

namespace assay_host {

namespace {

// Enough for any machine, and few enough for a 32-bit integer.
constexpr std::size_t kMaxIndexDigits = 9;

bool StartsWith(std::string_view text, std::string_view start)
{
    return text.substr(0, start.size()) == start;
}

// Whether the text is an index as the child prints it: decimal, without leading zeros.
bool IsIndex(std::string_view text)
{
    return !text.empty() && text.size() <= kMaxIndexDigits &&
           (text.size() == 1 || text.front() != '0') &&
           text.find_first_not_of("0123456789") == std::string_view::npos;
}

// A key is visible ASCII without quotes. Other bytes before the '=' make the line a raw one.
bool IsKey(std::string_view text)
{
    return !text.empty() && std::all_of(text.begin(), text.end(), [](char character) {
        return character > ' ' && character <= '~' && character != '"';
    });
}

struct Halves {
    std::string_view fKey;
    std::string_view fValue;
};

std::optional<Halves> Split(std::string_view text)
{
    const std::size_t sign = text.find('=');
    if (sign == std::string_view::npos || !IsKey(text.substr(0, sign)))
        return std::nullopt;
    return Halves{text.substr(0, sign), text.substr(sign + 1)};
}

bool IsClosed(std::string_view quoted)
{
    return quoted.size() >= 2 && quoted.back() == '"';
}

} // namespace

ReportLine ReadLine(std::string text, std::string lineEnd, bool cut)
{
    ReportLine line;
    line.fText = std::move(text);
    line.fLineEnd = std::move(lineEnd);
    line.fCut = cut;
    if (StartsWith(line.fText, "#")) {
        line.fKind = LineKind::kComment;
        return line;
    }
    const std::optional<Halves> halves = Split(line.fText);
    if (!halves)
        return line;
    std::string_view value = halves->fValue;
    const bool quoted = StartsWith(value, "\"");
    if (quoted && !cut && !IsClosed(value))
        return line;
    if (quoted)
        value = cut ? value.substr(1) : value.substr(1, value.size() - 2);
    line.fKind = LineKind::kValue;
    line.fKey = halves->fKey;
    line.fValue = value;
    line.fQuoted = quoted;
    return line;
}

bool IsWholeValue(const ReportLine& line)
{
    return line.fKind == LineKind::kValue && !line.fCut && !line.fLineEnd.empty();
}

bool IsStamp(const ReportLine& line)
{
    return line.fQuoted && IsWholeValue(line);
}

bool LeavesQuoteOpen(std::string_view text)
{
    if (StartsWith(text, "#"))
        return false;
    const std::optional<Halves> halves = Split(text);
    return halves && StartsWith(halves->fValue, "\"") && !IsClosed(halves->fValue);
}

bool BeginsLikeReportLine(std::string_view text)
{
    if (StartsWith(text, "#") || StartsWith(text, "gputag.") || GetDeviceTag(text))
        return true;
    const std::string_view word = text.substr(0, text.find('='));
    return word.size() < text.size() && FindKnownKey(std::nullopt, word) != nullptr;
}

std::optional<DeviceTag> ReadDeviceTag(std::string_view text)
{
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
        const std::string_view word = GetTagWord(kind);
        if (!StartsWith(text, word))
            continue;
        const std::string_view brackets = text.substr(word.size());
        if (brackets.empty() || brackets.front() != '[' || brackets.back() != ']')
            return std::nullopt;
        const std::string_view index = brackets.substr(1, brackets.size() - 2);
        if (!IsIndex(index))
            return std::nullopt;
        return DeviceTag{kind, static_cast<std::size_t>(ReadUnsigned(index).value())};
    }
    return std::nullopt;
}

std::optional<std::string_view> GetDeviceTag(std::string_view key)
{
    const std::size_t point = key.find('.');
    if (point == std::string_view::npos || !ReadDeviceTag(key.substr(0, point)))
        return std::nullopt;
    return key.substr(0, point);
}

} // namespace assay_host
