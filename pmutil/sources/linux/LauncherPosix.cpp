#include "pmutil/LauncherPosix.h"

#include <cerrno>
#include <csignal>
#include <cstring>
#include <fcntl.h>
#include <spawn.h>
#include <unistd.h>

#include <sstream>
#include <stdexcept>
#include <vector>

#include <boost/filesystem/path.hpp>
#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>

#include "all/BinioLog.h"
#include "all/PathCodecvt.h"
#include "linux/CallFailure.h"
#include "linux/ChildProcess.h"
#include "pmutil/PosixHandle.h"

namespace pmutil {

namespace {

// The size of the pipe of standard output, for children that write much: the default of
// /proc/sys/fs/pipe-max-size. The other pipes keep the usual size, because there is a limit for all
// pipes of a user.
constexpr int kOutputPipeBytes = 1 << 20;

// The first descriptor after the standard streams.
constexpr int kMinOtherDescriptor = 3;

// A pipe with one end for the parent and one for the child.
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
        ::fcntl(writer->GetHandle(), F_SETPIPE_SZ, kOutputPipeBytes); // optional: ignore a failure
    }

private:
    static boost::shared_ptr<PosixHandle> MakeClosed()
    {
        return boost::make_shared<PosixHandle>(PosixCalls::GetInvalid(), false);
    }

    // In a host whose standard streams are closed, the pipe may get their numbers, which the
    // child's streams would overwrite.
    static void MoveUp(PosixHandle& end)
    {
        if (end.GetHandle() >= kMinOtherDescriptor)
            return;
        const int moved = ::fcntl(end.GetHandle(), F_DUPFD_CLOEXEC, kMinOtherDescriptor);
        if (moved < 0)
            throw CallFailure{"fcntl", errno};
        end.Reset(moved, true);
    }
};

// The arguments of posix_spawn for the child's descriptors, signals and process group.
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

    // Call after SetStream.
    void CloseOthers()
    {
        Check(::posix_spawn_file_actions_addclosefrom_np(&fActions, kMinOtherDescriptor));
    }

    void ResetSignals()
    {
        sigset_t all;
        sigset_t none;
        ::sigfillset(&all);
        ::sigemptyset(&none);
        Check(::posix_spawnattr_setsigdefault(&fAttributes, &all));
        Check(::posix_spawnattr_setsigmask(&fAttributes, &none));
        AddFlags(POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK);
    }

    // The default group id is the child's process id.
    void MakeGroup() { AddFlags(POSIX_SPAWN_SETPGROUP); }

    const posix_spawn_file_actions_t* GetActions() const { return &fActions; }
    const posix_spawnattr_t* GetAttributes() const { return &fAttributes; }

private:
    static void Check(int error)
    {
        if (error != 0)
            throw CallFailure{"posix_spawn", error};
    }

    void AddFlags(int flags)
    {
        fFlags = static_cast<short>(fFlags | flags);
        Check(::posix_spawnattr_setflags(&fAttributes, fFlags));
    }

    short fFlags = 0;
    posix_spawn_file_actions_t fActions{};
    posix_spawnattr_t fAttributes{};
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

// Fails if the host makes the system discard the exit statuses of children: the child couldn't be
// waited for, and its process id could be reused before its descriptor is opened.
void RequireWaitableChildren(const std::string& path)
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

LauncherPosix::LauncherPosix(Group group) : fGroup(group) {}
LauncherPosix::~LauncherPosix() = default;

boost::shared_ptr<ChildProcess> LauncherPosix::GetChild() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fChild;
}

LaunchResult LauncherPosix::Launch(const std::wstring& program, const std::deque<std::string>& args)
{
    ReapOrphans();
    const std::string path = GetUTF8(program);
    try {
        return Start(path, args);
    } catch (const CallFailure& failure) {
        ThrowFailed(failure, path);
    }
}

LaunchResult LauncherPosix::Start(const std::string& path, const std::deque<std::string>& args)
{
    RequireWaitableChildren(path);
    RequireNoZeroByte(path);
    std::vector<char*> argv;
    argv.push_back(const_cast<char*>(path.c_str()));
    for (const std::string& arg : args) {
        RequireNoZeroByte(arg);
        argv.push_back(const_cast<char*>(arg.c_str()));
    }
    argv.push_back(nullptr);

    const ChildPipe input;
    LogPipe("Stdin", input);
    const ChildPipe output;
    output.Enlarge();
    LogPipe("Stdout", output);
    const ChildPipe error;
    LogPipe("Stderr", error);
    SpawnOptions options;
    options.SetStream(STDIN_FILENO, *input.reader);
    options.SetStream(STDOUT_FILENO, *output.writer);
    options.SetStream(STDERR_FILENO, *error.writer);
    options.CloseOthers();
    options.ResetSignals();
    if (fGroup == Group::kOwn)
        options.MakeGroup();

    // Allocate it first, so that no failure can leave the new process without an owner.
    const auto child = boost::make_shared<ChildProcess>();
    ::pid_t pid = 0;
    const int failure = ::posix_spawn(&pid, path.c_str(), options.GetActions(),
                                      options.GetAttributes(), argv.data(), ::environ);
    if (failure != 0)
        throw CallFailure{"posix_spawn", failure};
    // Close the child's ends before Adopt, which needs a free descriptor.
    for (const auto& end : {input.reader, output.writer, error.writer})
        end->Close();
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
    const boost::shared_ptr<ChildProcess> child = GetChild();
    if (child == nullptr)
        ThrowFailed({"waitid", ECHILD});
    return child->Wait(exitCode);
}

void LauncherPosix::Kill()
{
    const boost::shared_ptr<ChildProcess> child = GetChild();
    if (child != nullptr)
        child->Kill();
}

int LauncherPosix::GetTermSignal() const
{
    const boost::shared_ptr<ChildProcess> child = GetChild();
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
