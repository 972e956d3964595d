// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A channel over a Windows handle.
//
// A failed call throws std::runtime_error with its name, such as "CreateFileW failed".
#pragma once

#include <cstdint>
#include <string>

#include "pmutil/HandleChannel.h"

namespace pmutil {

// The system calls.
struct WinCalls {
    using Handle = void*;
    using Path = std::wstring;

    static constexpr const char* kName = "WinHandle";
    static Handle GetInvalid(); // INVALID_HANDLE_VALUE

    // Results are ignored.
    static void Close(Handle handle);
    static void Delete(const Path& path);

    // Opens a file, shared for reading, writing and deleting, and not inherited by child processes.
    // `access` and `creation` are the flags of OpenFile, which are checked first.
    static Handle Open(const Path& path, int access, int creation);
    static std::uint64_t Read(Handle handle, void* bytes, std::uint64_t nbytes);
    static std::uint64_t Write(Handle handle, const void* bytes, std::uint64_t nbytes);
    static void Seek(Handle handle, std::int64_t offset, SeekOrigin origin);
    static std::uint64_t SeekAndTell(Handle handle, std::int64_t offset, SeekOrigin origin);
    static void SetEndOfFile(Handle handle);

    // Returns the user's folder for temporary files.
    static Path GetTemporaryDirectory();
    static Path MakeTemporaryFileName(const Path& prefix);

    // `number`: 0 input, 1 output, 2 error.
    static Handle GetStandard(int number);
};

extern template class HandleChannel<WinCalls>;
using WinHandle = HandleChannel<WinCalls>;

} // namespace pmutil
