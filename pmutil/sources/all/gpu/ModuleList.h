// The program and the libraries that this process has loaded.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace pmutil {

// Returns their absolute paths in the loader's order, in UTF-8 on Windows and with the system's
// bytes elsewhere. Leaves out what has no path, and paths with a control character. Throws only
// std::bad_alloc. Any thread may call.
std::vector<std::string> ListModules();

// Returns a number that changes when a library is loaded. Any thread may call.
std::uint64_t CountLoads() noexcept;

// Keeps errno and Windows' last error: the destructor sets the value that the constructor found.
class LastError {
public:
    LastError() noexcept;
    ~LastError();
    LastError(const LastError&) = delete;
    LastError& operator=(const LastError&) = delete;

private:
    const unsigned long fValue;
};

} // namespace pmutil
