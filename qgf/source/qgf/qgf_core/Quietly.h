// Driver calls in destructors.
#pragma once

namespace QGF {
namespace Core {

// Calls `call` and ignores exceptions. A driver written in C++ may throw through its C interface;
// from a destructor that would terminate the process.
template <typename Call>
void Quietly(Call call) noexcept
{
    try {
        call();
    } catch (...) {
    }
}

} // namespace Core
} // namespace QGF
