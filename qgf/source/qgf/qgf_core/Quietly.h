// For driver calls on the way out.
#pragma once

namespace QGF {
namespace Core {

// Makes the call and ignores what it throws: a driver written in C++ may throw through its C
// interface, and that must not end the process here.
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
