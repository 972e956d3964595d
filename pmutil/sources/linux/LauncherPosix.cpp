#include "pmutil/LauncherPosix.h"

#include <cerrno>
#include <csignal>
#include <cstring>
#include <spawn.h>
#include <unistd.h>

#include <stdexcept>

#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>

#include "linux/CallFailure.h"
#include "linux/ChildPipes.h"
#include "linux/ChildProcess.h"
#include "linux/ChildWords.h"
#include "pmutil/KeptLauncher.h"
#include "pmutil/PosixHandle.h"

namespace pmutil {

namespace {

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

    // The child gets the default signals, and a group of its own if it's asked for.
    void SetAttributes(LauncherPosix::Group group)
    {
        sigset_t all;
        sigset_t none;
        ::sigfillset(&all);
        ::sigemptyset(&none);
        Check(::posix_spawnattr_setsigdefault(&fAttributes, &all));
        Check(::posix_spawnattr_setsigmask(&fAttributes, &none));
        int flags = POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK;
        if (group == LauncherPosix::Group::kOwn)
            flags |= POSIX_SPAWN_SETPGROUP; // the default group id is the child's process id
        Check(::posix_spawnattr_setflags(&fAttributes, static_cast<short>(flags)));
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

// Fails if the host makes the system discard the exit statuses of children: the child couldn't be
// waited for, and its process id could be reused before its descriptor is opened.
void RequireWaitableChildren(const std::string& path)
{
    struct sigaction action = {};
    ::sigaction(SIGCHLD, nullptr, &action);
    if (action.sa_handler == SIG_IGN || (action.sa_flags & SA_NOCLDWAIT) != 0)
        throw std::runtime_error("posix_spawn failed: " + path +
                                 ": SIGCHLD is ignored, so that no child can be waited for");
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
    const std::string path = GetPathInUTF8(program, "posix_spawn");
    try {
        return Start(path, args);
    } catch (const CallFailure& failure) {
        ThrowFailed(failure, path);
    }
}

LaunchResult LauncherPosix::Start(const std::string& path, const std::deque<std::string>& args)
{
    RequireWaitableChildren(path);
    const ChildWords words(path, args, "posix_spawn");
    const ChildPipes pipes;
    SpawnOptions options;
    options.SetStream(STDIN_FILENO, *pipes.fInput.reader);
    options.SetStream(STDOUT_FILENO, *pipes.fOutput.writer);
    options.SetStream(STDERR_FILENO, *pipes.fError.writer);
    options.CloseOthers();
    options.SetAttributes(fGroup);

    // Allocate it first, so that no failure can leave the new process without an owner.
    const auto child = boost::make_shared<ChildProcess>();
    ::pid_t pid = 0;
    const int failure = ::posix_spawn(&pid, path.c_str(), options.GetActions(),
                                      options.GetAttributes(), words.Get(), ::environ);
    if (failure != 0)
        throw CallFailure{"posix_spawn", failure};
    // Close the child's ends before Adopt, which needs a free descriptor.
    pipes.CloseChildEnds();
    child->Adopt(pid);
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fChild = child;
    }

    return pipes.GetHostEnds();
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
    int number = 0;
    if (const auto* const own = dynamic_cast<const LauncherPosix*>(&launcher))
        number = own->GetTermSignal();
    else if (const auto* const kept = dynamic_cast<const KeptLauncher*>(&launcher))
        number = kept->GetTermSignal();
    if (number == 0)
        return {};
    std::string text = "signal " + std::to_string(number);
    if (const char* const description = ::sigdescr_np(number))
        text += " (" + std::string(description) + ")";
    return text;
}

} // namespace pmutil
