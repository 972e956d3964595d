#include "pmutil/LauncherPosix.h"

#include <cerrno>
#include <csignal>
#include <cstring>
#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <stdexcept>
#include <system_error>
#include <vector>

#include <boost/filesystem/path.hpp>
#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>

#include "all/BinioLog.h"
#include "all/PathCodecvt.h"
#include "pmutil/PosixHandle.h"

namespace pmutil {

namespace {

// More than the usual pipe holds, for a child that writes much; what the system allows everybody.
// Only standard output gets it: a user's pipes share an allowance.
constexpr int kPipeBytes = 1 << 20;

// Descriptors below are the child's standard streams, and in its way.
constexpr int kFirstFree = 3;

// How long Kill waits to see off a child that nobody waits for.
constexpr int kReapMilliseconds = 1000;

// The C library's own are missing from older ones, and not meant for C++ in others.
int OpenPidfd(::pid_t pid)
{
    return static_cast<int>(::syscall(SYS_pidfd_open, pid, 0));
}

int SendSignal(int pidfd, int number)
{
    return static_cast<int>(::syscall(SYS_pidfd_send_signal, pidfd, number, nullptr, 0));
}

// A failed call before it is known for whom it was made.
struct CallFailure {
    const char* call;
    int error;
};

[[noreturn]] void ThrowFailed(const CallFailure& failure, const std::string& path = {})
{
    // A path with a zero byte ends there, so that the text behind it can be seen.
    // NOLINTNEXTLINE(readability-redundant-string-cstr)
    throw std::runtime_error(std::string(failure.call) + " failed: " + path.c_str() +
                             (path.empty() ? "" : ": ") +
                             std::system_category().message(failure.error));
}

// One end for the parent and one for the child.
struct ChildPipe {
    boost::shared_ptr<PosixHandle> reader;
    boost::shared_ptr<PosixHandle> writer;

    ChildPipe() : reader(MakeClosed()), writer(MakeClosed())
    {
        int ends[2];
        if (::pipe2(ends, O_CLOEXEC) != 0)
            throw CallFailure{"pipe2", errno};
        reader->Reset(ends[0], true);
        writer->Reset(ends[1], true);
        MoveUp(*reader);
        MoveUp(*writer);
    }

    void Enlarge() const
    {
        ::fcntl(writer->GetHandle(), F_SETPIPE_SZ, kPipeBytes); // a smaller pipe does as well
    }

private:
    static boost::shared_ptr<PosixHandle> MakeClosed()
    {
        return boost::make_shared<PosixHandle>(PosixCalls::GetInvalid(), false);
    }

    // A host without standard streams of its own gets their numbers for the pipe.
    static void MoveUp(PosixHandle& end)
    {
        if (end.GetHandle() >= kFirstFree)
            return;
        const int moved = ::fcntl(end.GetHandle(), F_DUPFD_CLOEXEC, kFirstFree);
        if (moved < 0)
            throw CallFailure{"fcntl", errno};
        end.Reset(moved, true);
    }
};

// What posix_spawn is told about the child's descriptors and signals.
class SpawnOptions {
public:
    SpawnOptions()
    {
        Check(::posix_spawn_file_actions_init(&fActions));
        const int error = ::posix_spawnattr_init(&fAttributes);
        if (error != 0) {
            ::posix_spawn_file_actions_destroy(&fActions);
            Check(error);
        }
    }
    ~SpawnOptions()
    {
        ::posix_spawn_file_actions_destroy(&fActions);
        ::posix_spawnattr_destroy(&fAttributes);
    }
    SpawnOptions(const SpawnOptions&) = delete;
    SpawnOptions& operator=(const SpawnOptions&) = delete;

    void SetStream(int stream, const PosixHandle& end)
    {
        Check(::posix_spawn_file_actions_adddup2(&fActions, end.GetHandle(), stream));
    }

    // After all SetStream.
    void CloseOthers() { Check(::posix_spawn_file_actions_addclosefrom_np(&fActions, kFirstFree)); }

    void ResetSignals()
    {
        sigset_t all;
        sigset_t none;
        ::sigfillset(&all);
        ::sigemptyset(&none);
        Check(::posix_spawnattr_setsigdefault(&fAttributes, &all));
        Check(::posix_spawnattr_setsigmask(&fAttributes, &none));
        Check(::posix_spawnattr_setflags(&fAttributes,
                                         POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK));
    }

    const posix_spawn_file_actions_t* GetActions() const { return &fActions; }
    const posix_spawnattr_t* GetAttributes() const { return &fAttributes; }

private:
    static void Check(int error)
    {
        if (error != 0)
            throw CallFailure{"posix_spawn", error};
    }

    posix_spawn_file_actions_t fActions{};
    posix_spawnattr_t fAttributes{};
};

// True once the process behind `pidfd` has ended, waiting up to `milliseconds`, or without a limit
// for -1.
bool PollEnd(int pidfd, int milliseconds)
{
    pollfd poll{pidfd, POLLIN, 0};
    int result = 0;
    do
        result = ::poll(&poll, 1, milliseconds);
    while (result < 0 && errno == EINTR);
    if (result < 0)
        ThrowFailed({"poll", errno});
    return result > 0;
}

// Children that nobody waits for any more. Each is looked after at times, so that it doesn't stay a
// zombie for long once it has ended.
class Orphans {
public:
    static Orphans& Get()
    {
        static Orphans& orphans = *new Orphans; // threads may outlive statics
        return orphans;
    }

    void Add(boost::shared_ptr<PosixHandle> pidfd)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fPidfds.push_back(std::move(pidfd));
    }

    void Reap()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        const auto hasEnded = [](const boost::shared_ptr<PosixHandle>& pidfd) {
            siginfo_t info = {};
            return ::waitid(P_PIDFD, static_cast<id_t>(pidfd->GetHandle()), &info,
                            WEXITED | WNOHANG) != 0 ||
                   info.si_pid != 0;
        };
        fPidfds.erase(std::remove_if(fPidfds.begin(), fPidfds.end(), hasEnded), fPidfds.end());
    }

private:
    boost::mutex fMutex;
    std::vector<boost::shared_ptr<PosixHandle>> fPidfds;
};

std::string GetUTF8(const std::wstring& program)
{
    try {
        return boost::filesystem::path(program, GetPathCodecvt()).native();
    } catch (const std::exception&) {
        ThrowFailed({"posix_spawn", EILSEQ});
    }
}

void RequireNoZeroByte(const std::string& text)
{
    if (text.find('\0') != std::string::npos)
        throw CallFailure{"posix_spawn", EINVAL};
}

// Where the host has the system throw away how children end, nobody could tell how this one did,
// and its number could be another process's before it has a descriptor.
void RequireEndsAreKept(const std::string& path)
{
    struct sigaction action = {};
    if (::sigaction(SIGCHLD, nullptr, &action) == 0 &&
        (action.sa_handler == SIG_IGN || (action.sa_flags & SA_NOCLDWAIT) != 0))
        throw std::runtime_error("posix_spawn failed: " + path +
                                 ": SIGCHLD is ignored, so that no child can be waited for");
}

void LogPipe(const char* stream, const ChildPipe& pipe)
{
    PM_LOG(gBinioLog, "child" << stream << "Rd=" << pipe.reader->GetHandle() << " child" << stream
                              << "Wr=" << pipe.writer->GetHandle());
}

} // namespace

// A started process. It is addressed by its process descriptor only, so that no signal can reach
// another process that has got its number since.
class LauncherPosix::Child {
public:
    Child() : fPidfd(boost::make_shared<PosixHandle>(PosixCalls::GetInvalid(), false)) {}

    // Called once, with a process just started.
    void Adopt(::pid_t pid)
    {
        const int pidfd = OpenPidfd(pid);
        if (pidfd < 0) {
            const int error = errno;
            ::kill(pid, SIGKILL); // not waited for yet, so the number is still the child's
            ::waitpid(pid, nullptr, 0);
            throw CallFailure{"pidfd_open", error};
        }
        fPidfd->Reset(pidfd, true);
    }

    ~Child()
    {
        if (!fPidfd->IsOpen())
            return;
        try {
            Orphans::Get().Add(fPidfd);
            Orphans::Get().Reap();
        } catch (...) {
            // Without memory for it, an ended child stays a zombie until this process ends.
        }
    }
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;

    WaitResult Wait(int* exitCode)
    {
        {
            const boost::lock_guard<boost::mutex> lock(fMutex);
            fHasWaiter = true;
        }
        if (fPidfd->IsOpen())
            PollEnd(fPidfd->GetHandle(), -1);
        const boost::lock_guard<boost::mutex> lock(fMutex);
        ReapLocked();
        if (fEnd.si_code == CLD_EXITED) {
            *exitCode = fEnd.si_status;
            return kEndedNormally;
        }
        return fKilled ? kEndedByKill : kEndedByCrash;
    }

    void Kill()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fKilled = true;
        if (!fPidfd->IsOpen())
            return;
        if (SendSignal(fPidfd->GetHandle(), SIGKILL) != 0 && errno != ESRCH)
            ThrowFailed({"pidfd_send_signal", errno});
        if (!fHasWaiter && PollEnd(fPidfd->GetHandle(), kReapMilliseconds))
            ReapLocked();
    }

    int GetTermSignal()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        return fEnd.si_code == CLD_KILLED || fEnd.si_code == CLD_DUMPED ? fEnd.si_status : 0;
    }

private:
    // The one place where the process is taken off the system's list. It has ended.
    void ReapLocked()
    {
        if (!fPidfd->IsOpen())
            return;
        const int result =
            ::waitid(P_PIDFD, static_cast<id_t>(fPidfd->GetHandle()), &fEnd, WEXITED);
        const int error = errno;
        fPidfd->Close();
        if (result != 0)
            ThrowFailed({"waitid", error});
    }

    boost::mutex fMutex;
    boost::shared_ptr<PosixHandle> fPidfd; // closed once the end is known
    bool fHasWaiter = false;               // from then on only the waiter reaps
    bool fKilled = false;
    siginfo_t fEnd{};
};

LauncherPosix::LauncherPosix() = default;
LauncherPosix::~LauncherPosix() = default;

boost::shared_ptr<LauncherPosix::Child> LauncherPosix::GetChild() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fChild;
}

LaunchResult LauncherPosix::Launch(const std::wstring& program, const std::deque<std::string>& args)
{
    Orphans::Get().Reap();
    const std::string path = GetUTF8(program);
    try {
        return Start(path, args);
    } catch (const CallFailure& failure) {
        ThrowFailed(failure, path);
    }
}

LaunchResult LauncherPosix::Start(const std::string& path, const std::deque<std::string>& args)
{
    RequireEndsAreKept(path);
    RequireNoZeroByte(path);
    std::vector<char*> argv;
    argv.push_back(const_cast<char*>(path.c_str()));
    for (const std::string& arg : args) {
        RequireNoZeroByte(arg);
        argv.push_back(const_cast<char*>(arg.c_str()));
    }
    argv.push_back(nullptr);

    const ChildPipe input;
    const ChildPipe output;
    const ChildPipe error;
    output.Enlarge();
    LogPipe("Stdin", input);
    LogPipe("Stdout", output);
    LogPipe("Stderr", error);
    SpawnOptions options;
    options.SetStream(STDIN_FILENO, *input.reader);
    options.SetStream(STDOUT_FILENO, *output.writer);
    options.SetStream(STDERR_FILENO, *error.writer);
    options.CloseOthers();
    options.ResetSignals();

    // Made first, so that no failure can come between the process and its owner.
    const auto child = boost::make_shared<Child>();
    ::pid_t pid = 0;
    const int failure = ::posix_spawn(&pid, path.c_str(), options.GetActions(),
                                      options.GetAttributes(), argv.data(), ::environ);
    if (failure != 0)
        throw CallFailure{"posix_spawn", failure};
    child->Adopt(pid);
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fChild = child;
    }

    LaunchResult result;
    result.fAppInput = input.writer;
    result.fAppOutput[static_cast<int>(OutputChannel::kStdout)] = output.reader;
    result.fAppOutput[static_cast<int>(OutputChannel::kStderr)] = error.reader;
    return result;
}

WaitResult LauncherPosix::Wait(int* exitCode)
{
    const boost::shared_ptr<Child> child = GetChild();
    if (child == nullptr)
        ThrowFailed({"waitid", ECHILD});
    return child->Wait(exitCode);
}

void LauncherPosix::Kill()
{
    const boost::shared_ptr<Child> child = GetChild();
    if (child != nullptr)
        child->Kill();
}

int LauncherPosix::GetTermSignal() const
{
    const boost::shared_ptr<Child> child = GetChild();
    return child != nullptr ? child->GetTermSignal() : 0;
}

boost::shared_ptr<Launcher> MakeLauncher()
{
    return boost::make_shared<LauncherPosix>();
}

std::string GetTerminationText(const Launcher& launcher)
{
    const auto* const own = dynamic_cast<const LauncherPosix*>(&launcher);
    const int number = own != nullptr ? own->GetTermSignal() : 0;
    if (number == 0)
        return {};
    std::string text = "signal " + std::to_string(number);
    if (const char* const description = ::sigdescr_np(number))
        text += " (" + std::string(description) + ")";
    return text;
}

} // namespace pmutil
