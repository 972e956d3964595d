// The channel over a file descriptor.
//
// A failed call throws std::runtime_error with its name and the system's own text, such as
// "open failed: No such file or directory". An interrupted call is repeated. A write to a pipe
// without a reader throws and raises no SIGPIPE, whatever the process does with that signal.
#pragma once

#include <cstdint>
#include <string>

#include "pmutil/HandleChannel.h"

namespace pmutil {

// The system's calls on a bare descriptor. Descriptors opened here close on exec.
struct PosixCalls {
    using Handle = int;
    using Path = std::string; // bytes as the system takes them; UTF-8 by custom

    static constexpr const char* kName = "PosixHandle";
    static constexpr Handle GetInvalid() { return -1; }

    // Results are ignored.
    static void Close(Handle handle);
    static void Delete(const Path& path);

    // Directories can't be opened. `access` and `creation` are valid flags of OpenFile.
    static Handle Open(const Path& path, int access, int creation);
    static std::uint64_t Read(Handle handle, void* bytes, std::uint64_t nbytes);
    static std::uint64_t Write(Handle handle, const void* bytes, std::uint64_t nbytes);
    static void Seek(Handle handle, std::int64_t offset, SeekOrigin origin);
    static std::uint64_t SeekAndTell(Handle handle, std::int64_t offset, SeekOrigin origin);
    static void SetEndOfFile(Handle handle);

    // TMPDIR, or /tmp where that isn't set.
    static Path GetTemporaryDirectory();
    static Path MakeTemporaryFileName(const Path& prefix);

    // `number`: 0 input, 1 output, 2 error.
    static Handle GetStandard(int number);
};

extern template class HandleChannel<PosixCalls>;
using PosixHandle = HandleChannel<PosixCalls>;

} // namespace pmutil
