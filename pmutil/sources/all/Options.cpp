#include "pmutil/Options.h"

#include <algorithm>
#include <cstdlib>
#include <limits>
#include <stdexcept>

namespace pmutil {

std::optional<Option> SplitOption(const std::string& argument)
{
    const std::size_t equals = argument.find('=');
    if (argument.empty() || argument.front() != '-' || equals == std::string::npos)
        return std::nullopt;
    Option option{argument.substr(1, equals - 1), argument.substr(equals + 1)};
    std::string& value = option.fValue;
    if (value.size() >= 2 && value.front() == '"' && value.back() == '"')
        value = value.substr(1, value.size() - 2);
    return option;
}

std::int32_t ParseInteger(const std::string& text)
{
    // Parse 64 bits and clamp, so that the result doesn't depend on the width of a long.
    char* end = nullptr;
    const long long value = std::strtoll(text.c_str(), &end, 0);
    if (end != nullptr) {
        using Limits = std::numeric_limits<std::int32_t>;
        return static_cast<std::int32_t>(
            std::clamp<long long>(value, Limits::min(), Limits::max()));
    }
    throw std::runtime_error("bad integer: \"" + text + '"');
}

} // namespace pmutil
