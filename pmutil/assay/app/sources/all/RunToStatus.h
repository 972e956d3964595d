// The outermost exception handler of the program.
#pragma once

namespace assay {

// Returns the result of run(), or 4 if it throws. The exception isn't reported: it comes from a
// failed report of another one.
template <typename Run>
int RunToStatus(const Run& run) noexcept
{
    constexpr int kStatusEscaped = 4;
    try {
        return run();
    } catch (...) {
        return kStatusEscaped;
    }
}

} // namespace assay
