// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A channel over an operating-system file or pipe handle. PosixHandle and WinHandle are its two
// instances; each has a `Platform` with the system calls.
#pragma once

#include <cstdint>
#include <string>

#include <boost/shared_ptr.hpp>

#include "pmutil/RandomAccess.h"

namespace pmutil {

// `access` of OpenFile.
inline constexpr int kOpenRead = 1;
inline constexpr int kOpenWrite = 2;
inline constexpr int kOpenReadWrite = 3;

// `creation` of OpenFile.
inline constexpr int kOpenExisting = 0;
inline constexpr int kTruncateExisting = 1;
inline constexpr int kOpenAlways = 2;
inline constexpr int kCreateAlways = 3;

enum class SeekOrigin { kBegin, kCurrent, kEnd };

// A failed system call throws std::runtime_error with the call's name. A read from a pipe whose
// other end is closed returns 0, the end of the data; a write to it fails. A transfer above the
// system's limit returns a smaller count.
template <typename Platform>
class HandleChannel : public RandomAccess {
public:
    using Handle = typename Platform::Handle;
    using Path = typename Platform::Path;

    // If `owned` is true, the destructor closes the handle and deletes the file at `path`, unless
    // that is null. The handle isn't duplicated: only one object may own it.
    HandleChannel(Handle handle, bool owned, const Path* path = nullptr);
    ~HandleChannel() override;

    // Releases the present handle like the destructor and sets another. Drops the bytes of Unread.
    void Reset(Handle handle, bool owned, const Path* path = nullptr);

    Handle GetHandle() const { return fHandle; }

    // Opens a file. The channel owns the handle; child processes don't inherit it. If
    // `deleteOnClose` is true, the file is deleted when the channel is closed. Throws
    // std::invalid_argument "OpenFile: bad access flags" or "OpenFile: bad creation flags" before
    // the file is accessed.
    static boost::shared_ptr<HandleChannel> OpenFile(const Path& path, int access, int creation,
                                                     bool deleteOnClose);

    // Makes a new empty file, open for reading and writing; it is deleted when the channel is
    // closed.
    static boost::shared_ptr<HandleChannel> MakeTemporaryFile(const Path& prefix);

    // Returns the directory of temporary files.
    static Path GetTemporaryDirectory();

    // Makes an empty file with a unique name in that directory and returns its path. The caller
    // deletes it.
    static Path MakeTemporaryFileName(const Path& prefix);

    // The process's standard channels, made on first use and never destroyed. They don't own their
    // handles, but Close closes the handle for the whole process.
    static Reader& GetStandardInput();
    static Writer& GetStandardOutput();
    static Writer& GetStandardError();

protected:
    // Closes the handle even if it isn't owned.
    void BinioClose() override;
    bool BinioIsOpen() const override;
    std::uint64_t BinioReadSome(void* bytes, std::uint64_t nbytes) override;
    std::uint64_t BinioWriteSome(const void* bytes, std::uint64_t nbytes) override;
    std::uint64_t BinioTell() override;
    void BinioSeek(std::uint64_t position) override;
    void BinioSeekRelative(std::int64_t delta) override;
    void BinioSeekEnd() override;
    void BinioSetEOF() override;

private:
    bool fOwned;
    Handle fHandle;
    Path fDeletePath;
};

} // namespace pmutil
