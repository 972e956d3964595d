#include "pmutil/XUnderrun.h"

#include <string>

namespace pmutil {

XUnderrun::XUnderrun(std::uint64_t count, const void* bytes)
    : std::runtime_error("I/O underrun, actual count=" + std::to_string(count)),
      fHasData(bytes != nullptr),
      fCount(count)
{
    if (bytes != nullptr) {
        const auto* const first = static_cast<const unsigned char*>(bytes);
        fData.assign(first, first + count);
    }
}

XUnderrun::~XUnderrun() = default;

} // namespace pmutil
