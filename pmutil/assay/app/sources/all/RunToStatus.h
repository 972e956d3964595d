// The outermost frame of the program.
#pragma once

namespace assay {

// What run() returns, or 4 for whatever it throws, of which nothing is told: whoever throws here
// could no longer say anything either.
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
