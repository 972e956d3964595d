#include "report/ValueText.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <optional>
#include <string_view>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/LineForm.h"
#include "report/Numbers.h"

namespace assay_host {

namespace {

std::string_view TrimEnd(std::string_view text)
{
    return text.substr(0, text.find_last_not_of(' ') + 1);
}

// Up to two decimals, without zeros at the end.
std::string TrimNumber(double value)
{
    std::string text = fmt::format("{:.2f}", value);
    text.erase(text.find_last_not_of('0') + 1);
    if (text.back() == '.')
        text.pop_back();
    return text;
}

std::optional<std::string> GetMebibytesText(std::string_view value)
{
    const auto mebibytes = ReadUnsigned(value);
    if (!mebibytes)
        return std::nullopt;
    if (*mebibytes < 1024)
        return fmt::format("{} MiB", *mebibytes);
    return TrimNumber(static_cast<double>(*mebibytes) / 1024) + " GiB";
}

std::optional<std::string> GetIdText(std::string_view value)
{
    const auto id = ReadUnsigned(value);
    if (!id)
        return std::nullopt;
    return fmt::format("0x{:04X} ({})", *id, *id);
}

std::string GetSpeedText(double speed)
{
    struct Unit {
        double fSize;
        const char* fName;
    };
    constexpr Unit kUnits[] = {{1e12, "TB/s"}, {1e9, "GB/s"}, {1e6, "MB/s"}, {1e3, "kB/s"}};
    for (const Unit& unit : kUnits)
        if (speed >= unit.fSize)
            return fmt::format(speed < 1e15 ? "{:.4g} {}" : "{:.0f} {}", speed / unit.fSize,
                               unit.fName);
    return fmt::format("{:.4g} B/s", speed);
}

// Returns the lower bound of a speed after this text; empty if there is none, or if the value is
// within a tenth of it.
std::string GetBoundText(const Answer& answer, const char* before)
{
    constexpr double kTenth = 0.1;
    if (answer.fLowerBound <= 0 || answer.fKnown->fForm != ValueForm::kBytesPerSecond)
        return {};
    const auto value = ReadDouble(answer.fLine->fValue);
    if (answer.IsKnown() && value &&
        std::abs(*value - answer.fLowerBound) <= kTenth * std::max(*value, answer.fLowerBound))
        return {};
    return fmt::format("{}at least {} by the host's clock", before,
                       GetSpeedText(answer.fLowerBound));
}

std::optional<std::string> GetFlagText(std::string_view value)
{
    if (value == "0")
        return "no";
    if (value == "1")
        return "yes";
    return std::nullopt;
}

// Shows "[8]" as "8". A longer list is shown as it is.
std::optional<std::string> GetCountText(std::string_view value)
{
    const auto numbers = ReadNumberList(value);
    if (!numbers || numbers->size() != 1)
        return std::nullopt;
    return std::string(value.substr(1, value.size() - 2));
}

// Reads a date in the form of WMI, "20210315000000.000000-000".
std::optional<std::string> GetDateText(std::string_view value)
{
    const auto isDigit = [](char character) { return character >= '0' && character <= '9'; };
    constexpr std::size_t kPoint = 14;
    if (value.size() != 25 || value[kPoint] != '.' ||
        !std::all_of(value.begin(), value.begin() + kPoint, isDigit))
        return std::nullopt;
    return fmt::format("{}-{}-{}", value.substr(0, 4), value.substr(4, 2), value.substr(6, 2));
}

std::optional<std::string> GetFormText(ValueForm form, std::string_view value)
{
    switch (form) {
    case ValueForm::kText:
    case ValueForm::kAdapter:
        break;
    case ValueForm::kDate:
        return GetDateText(value);
    case ValueForm::kFlag:
        return GetFlagText(value);
    case ValueForm::kCount:
        return GetCountText(value);
    case ValueForm::kTexels:
        if (value == "0")
            return "none";
        if (ReadUnsigned(value))
            return fmt::format("{} x {} texels", value, value);
        break;
    case ValueForm::kMebibytes:
        return GetMebibytesText(value);
    case ValueForm::kId:
        return GetIdText(value);
    case ValueForm::kBytesPerSecond:
        if (const auto speed = ReadDouble(value))
            return GetSpeedText(*speed);
        break;
    case ValueForm::kScore:
        break;
    }
    return std::nullopt;
}

// Returns what is shown instead of a value that is not known; nothing if the value itself is shown.
std::optional<std::string> GetUnknownValueText(const Answer& answer)
{
    switch (answer.fUnknown) {
    case Unknown::kNot:
    case Unknown::kCut:
        break;
    case Unknown::kNoAdapter:
        return answer.fKnown->fForm == ValueForm::kAdapter
                   ? "none (no adapter of the system matches)"
                   : "not known (no adapter of the system matches)";
    case Unknown::kNotListed:
        return "not known (not in the adapter lists)";
    case Unknown::kEmpty:
        return "not known (the text is empty)";
    case Unknown::kNoFigure:
        return "not known (no source has it)";
    case Unknown::kNoTime:
    case Unknown::kImplausible:
        return fmt::format("not known ({}: {}{})", GetUnknownText(answer.fUnknown),
                           ShowBytes(answer.fLine->fValue), GetBoundText(answer, "; "));
    }
    return std::nullopt;
}

// Returns what follows a value that is known.
std::string GetNote(const Answer& answer)
{
    if (!answer.fKnown)
        return {};
    // The newest version that the child distinguishes stands for all newer ones, too.
    if (answer.fKnown->fKey == "GLVersion" && answer.fLine->fValue == "4.1")
        return " or later";
    const std::string bound = GetBoundText(answer, " (");
    if (!bound.empty())
        return bound + ")";
    return answer.fKnown->fForm == ValueForm::kScore ? " (no unit; more is better)" : "";
}

} // namespace

std::string GetValueText(const Answer& answer)
{
    if (!answer.fLine)
        return fmt::format("- ({})", GetMissingText(answer.fMissing));
    if (const auto unknown = GetUnknownValueText(answer))
        return *unknown;
    const std::string& value = answer.fLine->fValue;
    std::optional<std::string> text;
    if (answer.fKnown)
        text = GetFormText(answer.fKnown->fForm, value);
    if (!text)
        text = ShowBytes(TrimEnd(value));
    if (!IsWholeValue(*answer.fLine))
        *text += "... (cut)";
    else
        *text += GetNote(answer);
    return text->empty() ? "(empty)" : *text;
}

std::string GetDeviceName(const DeviceAnswers& device)
{
    if (device.fKind == DeviceKind::kOpenCL)
        return device.GetValue("CLName");
    const std::string name = device.GetValue("GLName");
    return name.empty() ? device.GetValue("GLRenderer") : name;
}

} // namespace assay_host
