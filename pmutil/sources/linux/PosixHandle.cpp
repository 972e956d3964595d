#include "pmutil/PosixHandle.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <ctime>
#include <fcntl.h>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

#include "all/HandleChannelImpl.h"
#include "all/OpenFlags.h"

namespace pmutil {

namespace {

// The kernel transfers at most this many bytes per call (MAX_RW_COUNT) and rejects sizes above the
// signed range.
constexpr std::uint64_t kMaxBytesPerCall = 0x7FFFF000;

// Read and write for all, less the process's umask.
constexpr ::mode_t kFileMode = S_IRUSR | S_IWUSR | S_IRGRP | S_IWGRP | S_IROTH | S_IWOTH;

[[noreturn]] void ThrowCallFailed(const char* call, int error)
{
    throw std::runtime_error(std::string(call) +
                             " failed: " + std::system_category().message(error));
}

template <typename Call>
auto RetryInterrupted(Call call)
{
    auto result = call();
    while (result == -1 && errno == EINTR)
        result = call();
    return result;
}

int GetOpenFlags(int access, int creation)
{
    static constexpr int kAccess[] = {O_RDONLY, O_WRONLY, O_RDWR};
    static constexpr int kCreation[] = {0, O_TRUNC, O_CREAT, O_CREAT | O_TRUNC};
    return kAccess[access - kOpenRead] | kCreation[creation - kOpenExisting] | O_CLOEXEC;
}

int GetWhence(SeekOrigin origin)
{
    switch (origin) {
    case SeekOrigin::kBegin:
        return SEEK_SET;
    case SeekOrigin::kCurrent:
        return SEEK_CUR;
    case SeekOrigin::kEnd:
        break;
    }
    return SEEK_END;
}

// Blocks SIGPIPE on the calling thread, and removes the one that a write raises meanwhile. The
// signal's disposition, which belongs to the host application, doesn't change.
class PipeSignalBlock {
public:
    PipeSignalBlock()
    {
        sigemptyset(&fPipeSignal);
        sigaddset(&fPipeSignal, SIGPIPE);
        pthread_sigmask(SIG_BLOCK, &fPipeSignal, &fOldMask);
        if (sigismember(&fOldMask, SIGPIPE) == 1) {
            sigset_t pending;
            sigemptyset(&pending);
            sigpending(&pending);
            fWasPending = sigismember(&pending, SIGPIPE) == 1;
        }
    }

    ~PipeSignalBlock() { pthread_sigmask(SIG_SETMASK, &fOldMask, nullptr); }
    PipeSignalBlock(const PipeSignalBlock&) = delete;
    PipeSignalBlock& operator=(const PipeSignalBlock&) = delete;

    // Removes the pending SIGPIPE, unless one was pending before.
    void ClearPending()
    {
        if (fWasPending)
            return;
        const timespec noWait{};
        RetryInterrupted([&] { return sigtimedwait(&fPipeSignal, nullptr, &noWait); });
    }

private:
    sigset_t fPipeSignal{};
    sigset_t fOldMask{};
    bool fWasPending = false;
};

} // namespace

void PosixCalls::Close(Handle handle)
{
    // Don't repeat an interrupted close: the descriptor has been released.
    if (handle != GetInvalid())
        ::close(handle);
}

void PosixCalls::Delete(const Path& path)
{
    if (!path.empty())
        ::unlink(path.c_str());
}

PosixCalls::Handle PosixCalls::Open(const Path& path, int access, int creation)
{
    static constexpr char kCall[] = "open";
    RequireOpenFlags(access, creation);
    // Reject a path with a zero byte, which would open another file, and truncation without write
    // access, which the kernel would carry out.
    if (path.find('\0') != Path::npos || (access == kOpenRead && creation == kTruncateExisting))
        ThrowCallFailed(kCall, EINVAL);
    const Handle handle = RetryInterrupted(
        [&] { return ::open(path.c_str(), GetOpenFlags(access, creation), kFileMode); });
    if (handle == GetInvalid())
        ThrowCallFailed(kCall, errno);
    struct ::stat status = {};
    if (::fstat(handle, &status) == 0 && S_ISDIR(status.st_mode)) {
        Close(handle);
        ThrowCallFailed(kCall, EISDIR);
    }
    return handle;
}

std::uint64_t PosixCalls::Read(Handle handle, void* bytes, std::uint64_t nbytes)
{
    const std::size_t wanted = std::min(nbytes, kMaxBytesPerCall);
    const ::ssize_t count = RetryInterrupted([&] { return ::read(handle, bytes, wanted); });
    if (count < 0)
        ThrowCallFailed("read", errno);
    return static_cast<std::uint64_t>(count);
}

std::uint64_t PosixCalls::Write(Handle handle, const void* bytes, std::uint64_t nbytes)
{
    const std::size_t wanted = std::min(nbytes, kMaxBytesPerCall);
    PipeSignalBlock block;
    const ::ssize_t count = RetryInterrupted([&] { return ::write(handle, bytes, wanted); });
    const int error = errno;
    // If the reader closes during the write, the count is short and the signal is raised too.
    if (count < 0 ? error == EPIPE : static_cast<std::size_t>(count) < wanted)
        block.ClearPending();
    if (count < 0)
        ThrowCallFailed("write", error);
    return static_cast<std::uint64_t>(count);
}

void PosixCalls::Seek(Handle handle, std::int64_t offset, SeekOrigin origin)
{
    SeekAndTell(handle, offset, origin);
}

std::uint64_t PosixCalls::SeekAndTell(Handle handle, std::int64_t offset, SeekOrigin origin)
{
    const ::off_t position = ::lseek(handle, offset, GetWhence(origin));
    if (position < 0)
        ThrowCallFailed("lseek", errno);
    return static_cast<std::uint64_t>(position);
}

void PosixCalls::SetEndOfFile(Handle handle)
{
    const auto position = static_cast<::off_t>(SeekAndTell(handle, 0, SeekOrigin::kCurrent));
    if (RetryInterrupted([&] { return ::ftruncate(handle, position); }) != 0)
        ThrowCallFailed("ftruncate", errno);
}

PosixCalls::Path PosixCalls::GetTemporaryDirectory()
{
    // NOLINTNEXTLINE(concurrency-mt-unsafe): the environment is only read
    const char* const directory = ::secure_getenv("TMPDIR");
    return directory != nullptr && *directory != '\0' ? directory : "/tmp";
}

PosixCalls::Path PosixCalls::MakeTemporaryFileName(const Path& prefix)
{
    Path path = GetTemporaryDirectory() + "/" + prefix + "XXXXXX";
    const Handle handle = ::mkostemp(path.data(), O_CLOEXEC);
    if (handle == GetInvalid())
        ThrowCallFailed("mkostemp", errno);
    Close(handle);
    return path;
}

PosixCalls::Handle PosixCalls::GetStandard(int number)
{
    return number;
}

template class HandleChannel<PosixCalls>;

} // namespace pmutil
