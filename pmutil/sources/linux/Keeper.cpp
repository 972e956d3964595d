#include "linux/Keeper.h"

#include <cerrno>
#include <csignal>
#include <ctime>
#include <fcntl.h>
#include <linux/sched.h>
#include <poll.h>
#include <sched.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>

#include "linux/RawCall.h"

namespace pmutil {

namespace {

constexpr char kName[] = "child-keeper";

constexpr int kStandardStreams = 3;

// The time to kill the descendants when the keeper ends. No other process tries again.
constexpr int kLastMilliseconds = 10000;
constexpr long kPauseNanoseconds = 1000000;

// The kernel's form of struct sigaction begins with the handler; zeros are the default action.
struct KernelAction {
    void* fHandler;
    unsigned long fFlags;
    void* fRestorer;
    unsigned long fMask;
};
constexpr long kSignalSetBytes = 8;
constexpr int kSignals = 64;

// A record of getdents64.
struct FolderEntry {
    unsigned long fNode;
    long fOffset;
    unsigned short fBytes;
    unsigned char fType;
    char fName[1];
};

[[gnu::always_inline]] inline long Pass(const volatile void* pointer)
{
    return reinterpret_cast<long>(pointer);
}

bool IsDigit(char character)
{
    return character >= '0' && character <= '9';
}

int ReadNumber(const char* text)
{
    int number = 0;
    for (; IsDigit(*text); ++text)
        number = 10 * number + (*text - '0');
    return number;
}

// Calls `take` with each name of a folder that is a number.
template <typename Take>
void ForNumbersIn(const char* folder, Take take)
{
    const long list = RawCall(SYS_openat, AT_FDCWD, Pass(folder), O_RDONLY | O_DIRECTORY);
    alignas(FolderEntry) char block[4096];
    for (;;) {
        const long bytes = RawCall(SYS_getdents64, list, Pass(block), sizeof block);
        if (bytes <= 0)
            break;
        for (long at = 0; at < bytes;) {
            const auto* const entry = reinterpret_cast<const FolderEntry*>(block + at);
            if (IsDigit(entry->fName[0]))
                take(entry->fName, static_cast<int>(list));
            at += entry->fBytes;
        }
    }
    RawCall(SYS_close, list);
}

// Closes the descriptors from `first` to `last`.
void CloseRange(unsigned first, unsigned last)
{
    if (RawCall(SYS_close_range, first, last, 0) == 0)
        return;
    // Before Linux 5.9. The kernel continues the list at the next number, whatever is closed.
    ForNumbersIn("/proc/self/fd", [&](const char* name, int list) {
        const int number = ReadNumber(name);
        if (static_cast<unsigned>(number) >= first && static_cast<unsigned>(number) <= last &&
            number != list)
            RawCall(SYS_close, number);
    });
}

// Closes all descriptors except these.
void CloseAllBut(int first, int second, int third, int fourth)
{
    int kept[] = {first, second, third, fourth};
    for (int& left : kept)
        for (int& right : kept)
            if (&left < &right && left > right) {
                const int swapped = left;
                left = right;
                right = swapped;
            }
    unsigned next = 0;
    for (const int number : kept) {
        if (static_cast<unsigned>(number) > next)
            CloseRange(next, static_cast<unsigned>(number) - 1);
        next = static_cast<unsigned>(number) + 1;
    }
    CloseRange(next, ~0U);
}

void SetDefaultAction(int number)
{
    const KernelAction action = {nullptr, 0, nullptr, 0};
    RawCall(SYS_rt_sigaction, number, Pass(&action), 0, kSignalSetBytes);
}

// The child between its start and the program. Shares the keeper's memory, and never returns.
[[noreturn, gnu::noinline]] void StartProgram(const KeeperPlan& plan, int keeper,
                                              volatile int& error)
{
    RawCall(SYS_setpgid, 0, 0);
    // The child ends with its keeper.
    RawCall(SYS_prctl, PR_SET_PDEATHSIG, SIGKILL);
    if (RawCall(SYS_getppid) != keeper)
        RawCall(SYS_exit_group, 1);
    for (int stream = 0; stream < kStandardStreams; ++stream)
        RawCall(SYS_dup3, plan.fStreams[stream], stream, 0);
    CloseRange(kStandardStreams, ~0U);
    for (int number = 1; number <= kSignals; ++number)
        SetDefaultAction(number);
    const unsigned long none = 0;
    RawCall(SYS_rt_sigprocmask, SIG_SETMASK, Pass(&none), 0, kSignalSetBytes);
    error = static_cast<int>(
        -RawCall(SYS_execve, Pass(plan.fProgram), Pass(plan.fArgs), Pass(plan.fEnvironment)));
    for (;;)
        RawCall(SYS_exit_group, 1);
}

class Keeper {
public:
    Keeper(int link, int end, int host) : fLink(link), fEnd(end), fHost(host) {}

    // Returns 0 or the errno of the failed call.
    int Start(const KeeperPlan& plan)
    {
        fSelf = static_cast<int>(RawCall(SYS_getpid));
        volatile int error = 0;
        int pidfd = -1;
        // As vfork: the keeper continues when the child has begun the program or ended.
        long child =
            RawCall(SYS_clone, CLONE_VM | CLONE_VFORK | CLONE_PIDFD | SIGCHLD, 0, Pass(&pidfd));
        // An emulator of another processor has no CLONE_PIDFD.
        if (child == -EINVAL)
            child = RawCall(SYS_clone, CLONE_VM | CLONE_VFORK | SIGCHLD);
        if (child == 0)
            StartProgram(plan, fSelf, error);
        if (child < 0)
            return static_cast<int>(-child);
        fChild = static_cast<int>(child);
        fPidfd = pidfd >= 0 ? pidfd : static_cast<int>(RawCall(SYS_pidfd_open, child));
        return error;
    }

    void Reply(KeeperReply reply) const
    {
        RawCall(SYS_sendto, fLink, Pass(&reply), sizeof reply, MSG_NOSIGNAL);
    }

    // Follows the commands until the keeper may end.
    void Serve()
    {
        CloseAllBut(fLink, fEnd, fHost, fPidfd);
        for (;;) {
            pollfd polls[3];
            polls[0].fd = fLink;
            polls[1].fd = fHost;
            polls[2].fd = fHasEnded ? -1 : fPidfd;
            for (pollfd& poll : polls) {
                poll.events = POLLIN;
                poll.revents = 0;
            }
            RawCall(SYS_ppoll, Pass(polls), 3);
            if (polls[2].revents != 0)
                ReapAll();
            if (polls[1].revents != 0 || (polls[0].revents != 0 && !TakeCommand()))
                return;
        }
    }

    // Kills and reaps all descendants: as the subreaper, this process becomes the parent of all of
    // them. Returns whether none is left.
    bool EndAll(int milliseconds)
    {
        const long deadline = GetMilliseconds() + milliseconds;
        while (ReapAll()) {
            const bool isLate = GetMilliseconds() >= deadline;
            SignalChildren();
            if (isLate)
                return false;
            timespec pause = {0, kPauseNanoseconds};
            RawCall(SYS_nanosleep, Pass(&pause), 0);
        }
        return true;
    }

private:
    static long GetMilliseconds()
    {
        timespec now = {0, 0};
        RawCall(SYS_clock_gettime, CLOCK_MONOTONIC, Pass(&now));
        return ToMilliseconds(now.tv_sec, now.tv_nsec);
    }

    // Returns false if the keeper may end.
    bool TakeCommand()
    {
        KeeperCommand command = {KeeperCommand::kLeave}; // if the host has closed the link
        RawCall(SYS_recvfrom, fLink, Pass(&command), sizeof command);
        if (command.fKind == KeeperCommand::kLeave)
            return false;
        if (command.fKind == KeeperCommand::kEndAll)
            Reply(EndAll(command.fMilliseconds) ? 1 : 0);
        else
            RawCall(SYS_pidfd_send_signal, fPidfd, SIGKILL);
        return true;
    }

    // Reaps all children that have ended. Returns whether there are others.
    bool ReapAll()
    {
        for (;;) {
            siginfo_t info;
            info.si_pid = 0;
            const long result = RawCall(SYS_waitid, P_ALL, 0, Pass(&info), WEXITED | WNOHANG, 0);
            if (result == -ECHILD)
                return false;
            if (info.si_pid == 0)
                return true;
            if (info.si_pid == fChild)
                NoteEnd(info);
        }
    }

    void NoteEnd(const siginfo_t& info)
    {
        fHasEnded = true;
        const KeeperEnd end = {info.si_code, info.si_status};
        RawCall(SYS_write, fEnd, Pass(&end), sizeof end);
        RawCall(SYS_close, fEnd);
    }

    // Kills all children of this process; only it reaps them, so that no process id is reused.
    void SignalChildren() const
    {
        ForNumbersIn("/proc", [&](const char* name, int proc) {
            if (IsChild(name, proc))
                RawCall(SYS_kill, ReadNumber(name), SIGKILL);
        });
    }

    bool IsChild(const char* name, int proc) const
    {
        const long process = RawCall(SYS_openat, proc, Pass(name), O_PATH);
        const long file = RawCall(SYS_openat, process, Pass("stat"), O_RDONLY);
        char text[256];
        const long bytes = RawCall(SYS_read, file, Pass(text), sizeof text);
        RawCall(SYS_close, file);
        RawCall(SYS_close, process);
        // The name, in parentheses, may hold anything; after it come the state and the parent.
        long name_end = bytes - 1;
        while (name_end >= 0 && text[name_end] != ')')
            --name_end;
        // A zombie may have threads that live.
        return name_end >= 0 && ReadNumber(text + name_end + 4) == fSelf;
    }

    const int fLink;
    const int fEnd;
    const int fHost;
    int fSelf = 0;
    int fChild = 0;
    int fPidfd = -1;
    bool fHasEnded = false;
};

} // namespace

int RunKeeper(void* argument)
{
    const auto& plan = *static_cast<const KeeperPlan*>(argument);
    RawCall(SYS_setpgid, 0, 0);
    // The host may ignore it, and the system would then discard the exit statuses of children.
    SetDefaultAction(SIGCHLD);
    RawCall(SYS_prctl, PR_SET_NAME, Pass(kName));
    RawCall(SYS_prctl, PR_SET_CHILD_SUBREAPER, 1);
    Keeper keeper(plan.fLink, plan.fEnd, plan.fHost);
    const int error = keeper.Start(plan);
    keeper.Reply(error);
    if (error == 0)
        keeper.Serve();
    keeper.EndAll(kLastMilliseconds);
    for (;;)
        RawCall(SYS_exit_group, 0);
}

} // namespace pmutil
