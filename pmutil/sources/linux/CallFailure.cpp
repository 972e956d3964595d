#include "linux/CallFailure.h"

#include <stdexcept>
#include <system_error>

namespace pmutil {

void ThrowFailed(const CallFailure& failure, const std::string& path)
{
    // A path with a zero byte ends there, so that the text after it can be seen.
    // NOLINTNEXTLINE(readability-redundant-string-cstr)
    throw std::runtime_error(std::string(failure.call) + " failed: " + path.c_str() +
                             (path.empty() ? "" : ": ") +
                             std::system_category().message(failure.error));
}

} // namespace pmutil
