#include "supervise/ThreadSignals.h"

#include <csignal>

namespace assay_host {

class SignalBlock::Platform {
public:
    Platform()
    {
        sigset_t all;
        ::sigfillset(&all);
        ::pthread_sigmask(SIG_SETMASK, &all, &fBefore);
    }
    ~Platform() { ::pthread_sigmask(SIG_SETMASK, &fBefore, nullptr); }

private:
    sigset_t fBefore{};
};

SignalBlock::SignalBlock() : fPlatform(std::make_unique<Platform>()) {}
SignalBlock::~SignalBlock() = default;

} // namespace assay_host
