// The host's side of a keeper.
#pragma once

#include <optional>
#include <utility>

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>

#include "linux/Keeper.h"
#include "pmutil/PosixHandle.h"

namespace pmutil {

// The milliseconds of a limit for EndAll, which is at most 10 s.
int GetLimitMilliseconds(double seconds);

// The memory of a keeper's stack, with a part before it that can't be accessed.
class KeeperStack {
public:
    KeeperStack() = default;
    KeeperStack(KeeperStack&& other) noexcept : fMemory(std::exchange(other.fMemory, nullptr)) {}
    KeeperStack& operator=(KeeperStack&& other) noexcept
    {
        std::swap(fMemory, other.fMemory);
        return *this;
    }
    ~KeeperStack();

    void Make(); // throws CallFailure
    void Leak(); // the memory is never freed
    void* GetTop() const;

private:
    void* fMemory = nullptr;
};

// Any thread may call; Await only one.
class KeeperProcess {
public:
    KeeperProcess();
    ~KeeperProcess(); // as Leave()
    KeeperProcess(const KeeperProcess&) = delete;
    KeeperProcess& operator=(const KeeperProcess&) = delete;

    // Starts the keeper and its child. Sets the descriptors of the plan except fStreams. Call once.
    // Throws CallFailure; then the destructor ends what was started.
    void Start(KeeperPlan& plan);

    // Waits for the child's end. Returns nothing if the keeper was killed.
    std::optional<KeeperEnd> Await();

    void Kill();
    bool EndAll(double seconds);
    void Leave(); // throws nothing, also when memory is short

private:
    void Send(KeeperCommand command);
    int Clone(KeeperPlan& plan);

    boost::mutex fMutex;
    KeeperStack fStack;
    PosixHandle fLink;
    boost::shared_ptr<PosixHandle> fEnd;
    boost::shared_ptr<PosixHandle> fPidfd; // empty when the keeper was reaped
};

} // namespace pmutil
