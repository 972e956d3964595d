#include "linux/CallFailure.h"

#include <stdexcept>
#include <system_error>

namespace pmutil {

void ThrowFailed(const CallFailure& failure, const std::string& path)
{
    // Truncate the path at a zero byte, which would end the text for most readers.
    // NOLINTNEXTLINE(readability-redundant-string-cstr)
    throw std::runtime_error(std::string(failure.call) + " failed: " + path.c_str() +
                             (path.empty() ? "" : ": ") +
                             std::system_category().message(failure.error));
}

} // namespace pmutil
