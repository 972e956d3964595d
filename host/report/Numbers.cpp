#include "report/Numbers.h"

#include <charconv>
#include <cmath>
#include <cstddef>
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

} // namespace

std::optional<Number> ReadNumber(std::string_view text)
{
    if (const auto value = Read<std::int64_t>(text))
        return Number(*value);
    if (const auto value = Read<std::uint64_t>(text))
        return Number(*value);
    if (const auto value = ReadDouble(text))
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
