// Failures of the system's calls.
#pragma once

#include <string>

namespace pmutil {

// A failed call before it is known for whom it was made.
struct CallFailure {
    const char* call;
    int error;
};

// Throws std::runtime_error "CALL failed: PATH: TEXT", with the system's text, or without the path
// if there is none.
[[noreturn]] void ThrowFailed(const CallFailure& failure, const std::string& path = {});

} // namespace pmutil
