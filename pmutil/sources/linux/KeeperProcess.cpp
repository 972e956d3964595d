#include "linux/KeeperProcess.h"

#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <poll.h>
#include <sched.h>
#include <sys/mman.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <exception>
#include <list>

#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>

#include "linux/CallFailure.h"
#include "linux/ChildPipes.h"

namespace pmutil {

namespace {

constexpr int kMaxLeaveMilliseconds = 1000;

constexpr std::size_t kGuardBytes = 65536; // at least a page on every machine

PosixHandle MakeClosed()
{
    return PosixHandle(PosixCalls::GetInvalid(), false);
}

// Blocks all signals on this thread while it exists, so that the keeper never runs a handler of the
// host.
class AllSignalsBlocked {
public:
    AllSignalsBlocked()
    {
        sigset_t all;
        ::sigfillset(&all);
        ::pthread_sigmask(SIG_SETMASK, &all, &fBefore);
    }
    ~AllSignalsBlocked() { ::pthread_sigmask(SIG_SETMASK, &fBefore, nullptr); }
    AllSignalsBlocked(const AllSignalsBlocked&) = delete;
    AllSignalsBlocked& operator=(const AllSignalsBlocked&) = delete;

private:
    sigset_t fBefore{};
};

int OpenPidfd(::pid_t pid)
{
    const int pidfd = static_cast<int>(::syscall(SYS_pidfd_open, pid, 0));
    if (pidfd < 0)
        throw CallFailure{"pidfd_open", errno};
    return pidfd;
}

// Repeats the call while a signal interrupts it.
template <typename Call>
auto Repeat(Call call)
{
    auto result = call();
    while (result < 0 && errno == EINTR)
        result = call();
    return result;
}

void Reap(int pidfd)
{
    siginfo_t info = {};
    // __WALL, because the keeper's end has no signal.
    Repeat([&] {
        return ::waitid(static_cast<idtype_t>(P_PIDFD), static_cast<id_t>(pidfd), &info,
                        WEXITED | __WALL);
    });
}

bool HasEnded(int pidfd, int milliseconds)
{
    pollfd poll{pidfd, POLLIN, 0};
    return Repeat([&] { return ::poll(&poll, 1, milliseconds); }) > 0;
}

// Keepers that hadn't ended in time. They are reaped when others start.
class LateKeepers {
public:
    static LateKeepers& Get()
    {
        static LateKeepers& late = *new LateKeepers; // never destroyed: their stacks are in use
        return late;
    }

    // Takes the stack, unless it throws.
    void Add(const boost::shared_ptr<PosixHandle>& pidfd, KeeperStack& stack)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fKeepers.emplace_back(pidfd, std::move(stack));
    }

    void ReapEnded()
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        const auto reap = [](const Keeper& keeper) {
            const int pidfd = keeper.first->GetHandle();
            if (!HasEnded(pidfd, 0))
                return false;
            Reap(pidfd);
            return true;
        };
        fKeepers.remove_if(reap);
    }

private:
    using Keeper = std::pair<boost::shared_ptr<PosixHandle>, KeeperStack>;

    boost::mutex fMutex;
    std::list<Keeper> fKeepers;
};

} // namespace

int GetLimitMilliseconds(double seconds)
{
    return static_cast<int>(1000 * std::clamp(seconds, 0.0, 10.0));
}

KeeperStack::~KeeperStack()
{
    if (fMemory != nullptr)
        ::munmap(fMemory, kGuardBytes + kKeeperStackBytes);
}

void KeeperStack::Make()
{
    void* const memory = ::mmap(nullptr, kGuardBytes + kKeeperStackBytes, PROT_READ | PROT_WRITE,
                                MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE | MAP_STACK, -1, 0);
    if (memory == MAP_FAILED)
        throw CallFailure{"mmap", errno};
    fMemory = memory;
    if (::mprotect(memory, kGuardBytes, PROT_NONE) != 0)
        throw CallFailure{"mprotect", errno};
}

void KeeperStack::Leak()
{
    fMemory = nullptr;
}

void* KeeperStack::GetTop() const
{
    return static_cast<char*>(fMemory) + kGuardBytes + kKeeperStackBytes;
}

KeeperProcess::KeeperProcess() : fLink(MakeClosed()) {}

KeeperProcess::~KeeperProcess()
{
    Leave();
}

void KeeperProcess::Start(KeeperPlan& plan)
{
    LateKeepers::Get().ReapEnded();
    fStack.Make();
    int ends[2];
    if (::socketpair(AF_UNIX, SOCK_SEQPACKET | SOCK_CLOEXEC, 0, ends) != 0)
        throw CallFailure{"socketpair", errno};
    fLink.Reset(ends[0], true);
    PosixHandle link(ends[1], true);
    const ChildPipe pipe("End");
    fEnd = pipe.reader;
    PosixHandle host(OpenPidfd(::getpid()), true);
    plan.fLink = ends[1];
    plan.fEnd = pipe.writer->GetHandle();
    plan.fHost = host.GetHandle();
    // Allocated before the keeper exists, and kept only with a keeper: Leave waits for it.
    const auto pidfd = boost::make_shared<PosixHandle>(PosixCalls::GetInvalid(), false);
    pidfd->Reset(Clone(plan), true);
    fPidfd = pidfd;
    link.Close();

    KeeperReply reply = ECHILD; // if the keeper was killed
    Repeat([&] { return ::recv(fLink.GetHandle(), &reply, sizeof reply, 0); });
    if (reply != 0)
        throw CallFailure{"execve", reply};
}

int KeeperProcess::Clone(KeeperPlan& plan)
{
    const AllSignalsBlocked blocked;
    int pidfd = -1;
    if (::clone(RunKeeper, fStack.GetTop(), CLONE_VM | CLONE_PIDFD, &plan, &pidfd) >= 0)
        return pidfd;
    // An emulator of another processor can't share the memory.
    const int pid = errno == EINVAL ? ::clone(RunKeeper, fStack.GetTop(), SIGCHLD, &plan) : -1;
    if (pid < 0)
        throw CallFailure{"clone", errno};
    try {
        return OpenPidfd(pid);
    } catch (const CallFailure&) {
        // Nobody could reap it later. Its child ends with it.
        ::kill(pid, SIGKILL);
        Repeat([&] { return ::waitpid(pid, nullptr, 0); });
        throw;
    }
}

std::optional<KeeperEnd> KeeperProcess::Await()
{
    KeeperEnd end = {};
    const auto bytes = Repeat([&] { return ::read(fEnd->GetHandle(), &end, sizeof end); });
    if (bytes == static_cast<::ssize_t>(sizeof end))
        return end;
    return std::nullopt;
}

// A failure means that there is no keeper, or that it has ended, and the child with it.
void KeeperProcess::Send(KeeperCommand command)
{
    Repeat([&] { return ::send(fLink.GetHandle(), &command, sizeof command, MSG_NOSIGNAL); });
}

void KeeperProcess::Kill()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    Send({KeeperCommand::kKill});
}

bool KeeperProcess::EndAll(double seconds)
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    if (fPidfd == nullptr)
        return true;
    Send({KeeperCommand::kEndAll, GetLimitMilliseconds(seconds)});
    KeeperReply reply = 0; // if the keeper was killed
    Repeat([&] { return ::recv(fLink.GetHandle(), &reply, sizeof reply, 0); });
    return reply == 1;
}

void KeeperProcess::Leave()
{
    try {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        if (fPidfd == nullptr)
            return;
        Send({KeeperCommand::kLeave});
        if (HasEnded(fPidfd->GetHandle(), kMaxLeaveMilliseconds))
            Reap(fPidfd->GetHandle());
        else
            LateKeepers::Get().Add(fPidfd, fStack);
        fPidfd.reset();
        fLink.Close();
    } catch (const std::exception&) {
        fStack.Leak(); // no memory for the list of late keepers, and the keeper still uses it
    }
}

} // namespace pmutil
