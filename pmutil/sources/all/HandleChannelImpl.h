// The implementation of HandleChannel, for the platform sources that instantiate it.
#pragma once

#include <algorithm>
#include <limits>
#include <stdexcept>
#include <string>

#include "all/BinioLog.h"
#include "pmutil/Fmt.h"
#include "pmutil/HandleChannel.h"

namespace pmutil {

template <typename Platform>
HandleChannel<Platform>::HandleChannel(Handle handle, bool owned, const Path* path)
    : fOwned(false), fHandle(Platform::GetInvalid())
{
    Reset(handle, owned, path);
}

template <typename Platform>
HandleChannel<Platform>::~HandleChannel()
{
    Reset(Platform::GetInvalid(), true);
}

template <typename Platform>
void HandleChannel<Platform>::Reset(Handle handle, bool owned, const Path* path)
{
    Path newPath = path != nullptr ? *path : Path();
    if (fOwned) {
        const auto handleText = [this] {
            std::string text;
            Fmt::ToText(text, fHandle);
            return text;
        };
        PM_LOG(gBinioLog, Platform::kName << "::Reset closing " << handleText());
        Platform::Close(fHandle);
        Platform::Delete(fDeletePath);
    }
    DropPushback();
    fHandle = handle;
    fOwned = owned;
    fDeletePath.swap(newPath);
}

template <typename Platform>
auto HandleChannel<Platform>::OpenFile(const Path& path, int access, int creation,
                                       bool deleteOnClose) -> boost::shared_ptr<HandleChannel>
{
    // Make the owner first, so that a failed allocation can't leak the handle.
    boost::shared_ptr<HandleChannel> channel(new HandleChannel(Platform::GetInvalid(), false));
    Path deletePath = deleteOnClose ? path : Path();
    channel->fHandle = Platform::Open(path, access, creation);
    channel->fOwned = true;
    channel->fDeletePath.swap(deletePath);
    return channel;
}

template <typename Platform>
auto HandleChannel<Platform>::MakeTemporaryFile(const Path& prefix)
    -> boost::shared_ptr<HandleChannel>
{
    const Path path = Platform::MakeTemporaryFileName(prefix);
    try {
        return OpenFile(path, kOpenReadWrite, kCreateAlways, true);
    } catch (...) {
        Platform::Delete(path);
        throw;
    }
}

template <typename Platform>
auto HandleChannel<Platform>::GetTemporaryDirectory() -> Path
{
    return Platform::GetTemporaryDirectory();
}

template <typename Platform>
auto HandleChannel<Platform>::MakeTemporaryFileName(const Path& prefix) -> Path
{
    return Platform::MakeTemporaryFileName(prefix);
}

// The standard channels are never destroyed, so that they can be used during process exit.
template <typename Platform>
Reader& HandleChannel<Platform>::GetStandardInput()
{
    static HandleChannel& channel = *new HandleChannel(Platform::GetStandard(0), false);
    return channel;
}

template <typename Platform>
Writer& HandleChannel<Platform>::GetStandardOutput()
{
    static HandleChannel& channel = *new HandleChannel(Platform::GetStandard(1), false);
    return channel;
}

template <typename Platform>
Writer& HandleChannel<Platform>::GetStandardError()
{
    static HandleChannel& channel = *new HandleChannel(Platform::GetStandard(2), false);
    return channel;
}

template <typename Platform>
void HandleChannel<Platform>::BinioClose()
{
    fOwned = true;
    Reset(Platform::GetInvalid(), true);
}

template <typename Platform>
bool HandleChannel<Platform>::BinioIsOpen() const
{
    return fHandle != Platform::GetInvalid();
}

template <typename Platform>
std::uint64_t HandleChannel<Platform>::BinioReadSome(void* bytes, std::uint64_t nbytes)
{
    return Platform::Read(fHandle, bytes, nbytes);
}

template <typename Platform>
std::uint64_t HandleChannel<Platform>::BinioWriteSome(const void* bytes, std::uint64_t nbytes)
{
    return Platform::Write(fHandle, bytes, nbytes);
}

template <typename Platform>
std::uint64_t HandleChannel<Platform>::BinioTell()
{
    return Platform::SeekAndTell(fHandle, 0, SeekOrigin::kCurrent);
}

template <typename Platform>
void HandleChannel<Platform>::BinioSeek(std::uint64_t position)
{
    // Positions above the signed range become negative, which the system rejects.
    Platform::Seek(fHandle, static_cast<std::int64_t>(position), SeekOrigin::kBegin);
}

template <typename Platform>
void HandleChannel<Platform>::BinioSeekRelative(std::int64_t delta)
{
    Platform::Seek(fHandle, delta, SeekOrigin::kCurrent);
}

template <typename Platform>
void HandleChannel<Platform>::BinioSeekEnd()
{
    Platform::Seek(fHandle, 0, SeekOrigin::kEnd);
}

template <typename Platform>
void HandleChannel<Platform>::BinioSetEOF()
{
    Platform::SetEndOfFile(fHandle);
}

} // namespace pmutil
