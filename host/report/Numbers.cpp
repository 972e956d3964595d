#include "report/Numbers.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstddef>
#include <iterator>
#include <string>
#include <system_error>

namespace assay_host {

namespace {

template <typename T>
std::optional<T> Read(std::string_view text)
{
    T value{};
    const char* const end = text.data() + text.size();
    const std::from_chars_result result = std::from_chars(text.data(), end, value);
    if (result.ec != std::errc() || result.ptr != end)
        return std::nullopt;
    return value;
}

// The magnitude of a decimal number: its digits from the first to the last that isn't 0, and the
// power of ten after them. Zero has no digits and the exponent 0.
struct Decimal {
    std::string fDigits;
    std::int64_t fExponent = 0;

    bool operator==(const Decimal& other) const
    {
        return fDigits == other.fDigits && fExponent == other.fExponent;
    }
};

// The exponent of a number that is finite and not zero, so that it is small.
std::int64_t ReadExponent(std::string_view text)
{
    if (text[0] == '+')
        text.remove_prefix(1);
    return Read<std::int64_t>(text).value();
}

// The text must be one that ReadDouble accepts.
Decimal ReadDecimal(std::string_view text)
{
    Decimal result;
    const std::size_t mark = text.find_first_of("eE");
    const std::string_view number = text.substr(0, mark);
    std::copy_if(number.begin(), number.end(), std::back_inserter(result.fDigits),
                 [](char character) { return character >= '0' && character <= '9'; });
    const std::size_t first = result.fDigits.find_first_not_of('0');
    if (first == std::string::npos)
        return {}; // whatever its exponent is, which may be too large for any integer
    const std::size_t end = result.fDigits.find_last_not_of('0') + 1;
    if (mark != std::string_view::npos)
        result.fExponent = ReadExponent(text.substr(mark + 1));
    const std::size_t point = number.find('.');
    if (point != std::string_view::npos)
        result.fExponent -= static_cast<std::int64_t>(number.size() - point - 1);
    result.fExponent += static_cast<std::int64_t>(result.fDigits.size() - end);
    result.fDigits = result.fDigits.substr(first, end - first);
    return result;
}

// Whether the value's shortest text is the same decimal number as `text`.
bool KeepsDigits(std::string_view text, double value)
{
    char shortest[32];
    const auto end = std::to_chars(std::begin(shortest), std::end(shortest), value).ptr;
    return ReadDecimal(text) == ReadDecimal({shortest, static_cast<std::size_t>(end - shortest)});
}

} // namespace

std::optional<Number> ReadNumber(std::string_view text)
{
    constexpr std::int64_t kMaxExact = std::int64_t{1} << 53;
    if (text.find_first_not_of("-0123456789") == std::string_view::npos) {
        const auto value = Read<std::int64_t>(text);
        if (value && *value >= -kMaxExact && *value <= kMaxExact)
            return Number(*value);
        return std::nullopt;
    }
    const auto value = ReadDouble(text);
    if (value && KeepsDigits(text, *value))
        return Number(*value);
    return std::nullopt;
}

std::optional<std::vector<Number>> ReadNumberList(std::string_view text)
{
    if (text.empty() || text.front() != '[' || text.back() != ']')
        return std::nullopt;
    text = text.substr(1, text.size() - 2);
    std::vector<Number> numbers;
    constexpr std::string_view kBetween = ", ";
    while (true) {
        const std::size_t end = text.find(kBetween);
        const std::optional<Number> number = ReadNumber(text.substr(0, end));
        if (!number)
            return std::nullopt;
        numbers.push_back(*number);
        if (end == std::string_view::npos)
            return numbers;
        text.remove_prefix(end + kBetween.size());
    }
}

std::optional<double> ReadDouble(std::string_view text)
{
    const auto value = Read<double>(text);
    return value && std::isfinite(*value) ? value : std::nullopt;
}

std::optional<std::uint64_t> ReadUnsigned(std::string_view text)
{
    return Read<std::uint64_t>(text);
}

} // namespace assay_host
