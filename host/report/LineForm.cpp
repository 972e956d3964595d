#include "report/LineForm.h"

#include <algorithm>
#include <utility>

#include "report/Numbers.h"

namespace assay_host {

namespace {

// More digits than any machine has devices, and few enough for any integer.
constexpr std::size_t kMaxIndexDigits = 9;

bool StartsWith(std::string_view text, std::string_view start)
{
    return text.substr(0, start.size()) == start;
}

bool IsDigit(char character)
{
    return character >= '0' && character <= '9';
}

// Keys are words of visible ASCII; a blank or a byte of binary data before the '=' makes the line
// something else.
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

std::optional<std::string_view> GetDeviceTag(std::string_view key)
{
    if (!StartsWith(key, "glgpu[") && !StartsWith(key, "clgpu["))
        return std::nullopt;
    const std::size_t first = key.find('[') + 1;
    std::size_t end = first;
    while (end < key.size() && IsDigit(key[end]))
        ++end;
    const std::size_t digits = end - first;
    const bool isIndex =
        digits > 0 && digits <= kMaxIndexDigits && (digits == 1 || key[first] != '0');
    if (!isIndex || key.substr(end, 2) != "].")
        return std::nullopt;
    return key.substr(0, end + 1);
}

std::optional<DeviceTag> ReadDeviceTag(std::string_view tag)
{
    if (GetDeviceTag(std::string(tag) + ".") == std::nullopt)
        return std::nullopt;
    const std::size_t open = tag.find('[');
    const DeviceKind kind = tag.substr(0, open) == GetTagWord(DeviceKind::kOpenGL)
                                ? DeviceKind::kOpenGL
                                : DeviceKind::kOpenCL;
    const auto index = ReadUnsigned(tag.substr(open + 1, tag.size() - open - 2));
    return DeviceTag{kind, static_cast<std::size_t>(*index)};
}

} // namespace assay_host
