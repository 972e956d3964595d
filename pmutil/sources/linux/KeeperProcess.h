// The host's side of a keeper.
#pragma once

#include <optional>

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>

#include "linux/Keeper.h"
#include "pmutil/PosixHandle.h"

namespace pmutil {

// Any thread may call; Await only one.
class KeeperProcess {
public:
    KeeperProcess();
    ~KeeperProcess(); // as Leave()
    KeeperProcess(const KeeperProcess&) = delete;
    KeeperProcess& operator=(const KeeperProcess&) = delete;

    // Starts the keeper and its child. Sets the descriptors of the plan except fStreams. Call once.
    // Throws CallFailure; then there is no process.
    void Start(KeeperPlan& plan);

    // Waits for the child's end. Returns nothing if the keeper was killed.
    std::optional<KeeperEnd> Await();

    void Kill();
    bool EndAll(double seconds);
    void Leave();

private:
    // The memory of the keeper's stack, with a page before it that can't be accessed.
    class Stack {
    public:
        ~Stack();
        void Make(); // throws CallFailure
        void* GetTop() const;
        void Keep() { fMemory = nullptr; } // it is never freed

    private:
        void* fMemory = nullptr;
    };

    void Send(KeeperCommand command);
    int Clone(KeeperPlan& plan);

    boost::mutex fMutex;
    Stack fStack;
    PosixHandle fLink;
    boost::shared_ptr<PosixHandle> fEnd;
    PosixHandle fPidfd; // closed when the keeper was reaped
};

} // namespace pmutil
