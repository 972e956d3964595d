#include "supervise/Interrupt.h"

#include <atomic>
#include <csignal>
#include <initializer_list>

namespace assay_host {

namespace {

std::atomic<bool> gInterrupted{false};
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler sets it");

void NoteInterrupt(int /*number*/)
{
    gInterrupted = true;
}

} // namespace

void WatchForInterrupt()
{
    struct sigaction action = {};
    action.sa_handler = NoteInterrupt;
    action.sa_flags = static_cast<int>(SA_RESETHAND) | SA_RESTART;
    for (const int number : {SIGINT, SIGTERM, SIGHUP}) {
        struct sigaction before = {};
        ::sigaction(number, nullptr, &before);
        if (before.sa_handler != SIG_IGN) // as nohup has it
            ::sigaction(number, &action, nullptr);
    }
}

bool WasInterrupted()
{
    return gInterrupted;
}

} // namespace assay_host
