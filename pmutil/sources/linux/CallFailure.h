// Failures of system calls.
#pragma once

#include <string>

namespace pmutil {

// A failed call and its errno, thrown where the path for the failure text isn't known.
struct CallFailure {
    const char* call;
    int error;
};

// Throws std::runtime_error "CALL failed: PATH: TEXT", with the system's text, or without the path
// if there is none.
[[noreturn]] void ThrowFailed(const CallFailure& failure, const std::string& path = {});

} // namespace pmutil
