#include "supervise/Interrupt.h"

#include <cerrno>
#include <csignal>

#include <thread>
#include <utility>

#include "supervise/InterruptNotes.h"
#include "supervise/linux/Guarded.h"
#include "supervise/linux/Signals.h"

namespace assay_host {

void PrepareSignals()
{
    std::signal(SIGCHLD, SIG_DFL);
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);
    sigset_t none;
    ::sigemptyset(&none);
    ::pthread_sigmask(SIG_SETMASK, &none, nullptr);
}

void WatchForInterrupt(std::shared_ptr<pmutil::StopRequest> stop)
{
    SetInterruptStop(std::move(stop));
    // The run continues in the background of a terminal.
    std::signal(SIGTTIN, SIG_IGN);
    std::signal(SIGTTOU, SIG_IGN);
    const sigset_t awaited = GetEndSignals();
    // Block the signals in all threads, which inherit this mask.
    ::pthread_sigmask(SIG_SETMASK, &awaited, nullptr);
    std::thread([awaited] {
        for (;;) {
            if (::sigwaitinfo(&awaited, nullptr) < 0)
                continue;
            NoteInterrupt();
            if (!IsGuarded())
                NoteInterrupt(); // without the guardian, don't wait for readers
        }
    }).detach();
}

} // namespace assay_host
