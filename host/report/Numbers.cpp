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

// A decimal number without its sign: its digits from the first to the last that isn't 0, and the
// power of ten after them.
struct Decimal {
    std::string fDigits;
    long fExponent = 0;

    bool operator==(const Decimal& other) const
    {
        return fDigits == other.fDigits && (fDigits.empty() || fExponent == other.fExponent);
    }
};

// Of a text that from_chars takes.
Decimal ReadDecimal(std::string_view text)
{
    Decimal result;
    const std::size_t mark = text.find_first_of("eE");
    std::string_view number = text.substr(0, mark);
    if (number[0] == '-')
        number.remove_prefix(1);
    if (mark != std::string_view::npos) {
        std::string_view exponent = text.substr(mark + 1);
        if (exponent[0] == '+')
            exponent.remove_prefix(1);
        result.fExponent = Read<long>(exponent).value_or(0);
    }
    const std::size_t point = number.find('.');
    if (point != std::string_view::npos)
        result.fExponent -= static_cast<long>(number.size() - point - 1);
    std::copy_if(number.begin(), number.end(), std::back_inserter(result.fDigits),
                 [](char character) { return character >= '0' && character <= '9'; });
    const std::size_t last = result.fDigits.find_last_not_of('0') + 1;
    result.fExponent += static_cast<long>(result.fDigits.size() - last);
    result.fDigits.erase(last);
    result.fDigits.erase(0, std::min(result.fDigits.find_first_not_of('0'), last));
    return result;
}

// Whether the shortest text for the value is the same decimal number.
bool KeepsDigits(std::string_view text, double value)
{
    char shortest[32];
    const auto end = std::to_chars(std::begin(shortest), std::end(shortest), value).ptr;
    return ReadDecimal(text) == ReadDecimal({shortest, static_cast<std::size_t>(end - shortest)});
}

} // namespace

std::optional<Number> ReadNumber(std::string_view text)
{
    constexpr std::int64_t kMostExact = std::int64_t{1} << 53;
    if (text.find_first_not_of("-0123456789") == std::string_view::npos) {
        const auto value = Read<std::int64_t>(text);
        if (value && *value >= -kMostExact && *value <= kMostExact)
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
    if (text.size() < 2 || text.front() != '[' || text.back() != ']')
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
