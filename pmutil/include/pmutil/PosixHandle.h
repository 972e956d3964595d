// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A channel over a file descriptor.
//
// A failed call throws std::runtime_error with its name and the system's text, such as
// "open failed: No such file or directory". Interrupted calls are repeated. A write to a pipe
// without a reader throws and raises no SIGPIPE, whatever the signal's disposition is.
#pragma once

#include <cstdint>
#include <string>

#include "pmutil/HandleChannel.h"

namespace pmutil {

// The system calls. Descriptors opened here have close-on-exec set.
struct PosixCalls {
    using Handle = int;
    using Path = std::string; // bytes; UTF-8 by convention

    static constexpr const char* kName = "PosixHandle";
    static constexpr Handle GetInvalid() { return -1; }

    // Results are ignored.
    static void Close(Handle handle);
    static void Delete(const Path& path);

    // Directories can't be opened. `access` and `creation` are the flags of OpenFile, which are
    // checked first.
    static Handle Open(const Path& path, int access, int creation);
    static std::uint64_t Read(Handle handle, void* bytes, std::uint64_t nbytes);
    static std::uint64_t Write(Handle handle, const void* bytes, std::uint64_t nbytes);
    static void Seek(Handle handle, std::int64_t offset, SeekOrigin origin);
    static std::uint64_t SeekAndTell(Handle handle, std::int64_t offset, SeekOrigin origin);
    static void SetEndOfFile(Handle handle);

    // Returns TMPDIR; /tmp if it isn't set or the process runs with other privileges than the user
    // (secure_getenv).
    static Path GetTemporaryDirectory();
    static Path MakeTemporaryFileName(const Path& prefix);

    // `number`: 0 input, 1 output, 2 error.
    static Handle GetStandard(int number);
};

extern template class HandleChannel<PosixCalls>;
using PosixHandle = HandleChannel<PosixCalls>;

} // namespace pmutil
