// The channel over an operating-system file or pipe handle, as far as it is the same everywhere.
// PosixHandle and WinHandle are its two forms; each brings a `Platform` with the system's calls.
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

// From where a seek counts.
enum class SeekOrigin { kBegin, kCurrent, kEnd };

// Failed system calls throw std::runtime_error with the call's name. A read of a pipe whose other
// end is closed is the end of the data; a write to one fails. A transfer above the system's limit
// comes back short.
template <typename Platform>
class HandleChannel : public RandomAccess {
public:
    using Handle = typename Platform::Handle;
    using Path = typename Platform::Path;

    // With `owned` set the handle is closed with this object, and the file at `path`, if one is
    // given, deleted then. The handle is taken as it is; objects on one handle must agree on which
    // of them owns it.
    HandleChannel(Handle handle, bool owned, const Path* path = nullptr);
    ~HandleChannel() override;

    // Lets go of the present handle, as the destructor does, and takes another. What was put back
    // with Unread came from the old one and is forgotten.
    void Reset(Handle handle, bool owned, const Path* path = nullptr);

    Handle GetHandle() const { return fHandle; }

    // Opens a file; its handle is owned, and never inherited by a child process. With
    // `deleteOnClose` the file is deleted when the channel closes.
    // Throws std::invalid_argument "OpenFile: bad access flags" and "OpenFile: bad creation flags"
    // before the file is touched.
    static boost::shared_ptr<HandleChannel> OpenFile(const Path& path, int access, int creation,
                                                     bool deleteOnClose);

    // An empty file of its own, open for reading and writing, deleted when the channel closes.
    static boost::shared_ptr<HandleChannel> MakeTemporaryFile(const Path& prefix);

    // Where temporary files go.
    static Path GetTemporaryDirectory();

    // Makes an empty file with a name of its own in that directory, and gives its path. The caller
    // deletes it.
    static Path MakeTemporaryFileName(const Path& prefix);

    // The process's standard channels, made on first use and alive until the process ends. They
    // don't own their handles, but Close on one closes it for the whole process.
    static Reader& GetStandardInput();
    static Writer& GetStandardOutput();
    static Writer& GetStandardError();

protected:
    // Closes the handle whether it is owned or not.
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
