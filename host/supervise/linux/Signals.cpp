#include "supervise/linux/Signals.h"

#include <initializer_list>

namespace assay_host {

sigset_t GetEndSignals()
{
    sigset_t result;
    ::sigfillset(&result);
    for (const int number :
         {SIGKILL, SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGTRAP, SIGABRT, SIGSYS, // faults
          SIGPIPE, SIGXFSZ,                                                   // writes
          SIGSTOP, SIGTSTP, SIGTTIN, SIGTTOU, SIGCONT,                        // job control
          SIGCHLD, SIGURG, SIGWINCH})                                         // ignored by default
        ::sigdelset(&result, number);
    for (int number = 1; number <= SIGRTMAX; ++number) {
        struct sigaction action = {};
        ::sigaction(number, nullptr, &action);
        if (action.sa_handler == SIG_IGN)
            ::sigdelset(&result, number);
    }
    return result;
}

} // namespace assay_host
