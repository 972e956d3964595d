#include "support/InheritedState.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

void DoNothing(int /*signal*/) {}

// Returns whether a parent may ignore the signal so that the tests survive it. These get a handler,
// which isn't inherited by the programs that the tests start.
bool IsFromTheUser(int number)
{
    return number == SIGHUP || number == SIGINT || number == SIGQUIT;
}

void ResetSignals()
{
    for (int number = 1; number <= SIGRTMAX; ++number) {
        struct sigaction action = {};
        if (::sigaction(number, nullptr, &action) != 0 || action.sa_handler != SIG_IGN)
            continue;
        action = {};
        action.sa_handler = IsFromTheUser(number) ? DoNothing : SIG_DFL;
        action.sa_flags = SA_RESTART;
        ::sigaction(number, &action, nullptr);
    }
    sigset_t none;
    ::sigemptyset(&none);
    ::sigprocmask(SIG_SETMASK, &none, nullptr);
}

// Opens closed standard streams, so that no descriptor of a test becomes one.
void OpenStandardStreams()
{
    for (int stream = STDIN_FILENO; stream <= STDERR_FILENO; ++stream)
        if (::fcntl(stream, F_GETFD) < 0)
            ::open("/dev/null", O_RDWR); // NOLINT: no O_CLOEXEC, as any standard stream
}

// If this is the first process of a container, continues in a child. The parent reaps all children
// until that one has ended, and ends with its status, which ends whatever a test has left.
void LeaveFirstProcess()
{
    if (::getpid() != 1)
        return;
    const ::pid_t child = ::fork();
    if (child <= 0)
        return;
    int status = 0;
    for (::pid_t ended = 0; ended != child && (ended >= 0 || errno == EINTR);)
        ended = ::wait(&status);
    std::_Exit(WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status));
}

} // namespace

void DropInheritedState()
{
    ResetSignals();
    OpenStandardStreams();
    LeaveFirstProcess();
}
