// The owner of one running thread, who may give up waiting for it and let it go.
//
// A process-wide registry, which outlives everything, keeps the abandoned threads' objects alive.
// One ManagedThread is used by one thread at a time.
#pragma once

#include <cstddef>
#include <string>

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

namespace pmutil {

struct ManagedThreadRegistry;

class ManagedThread {
public:
    // `name` is a label for log lines; null stands for an empty one.
    explicit ManagedThread(const char* name = nullptr);

    // Abandons a thread that is still held; never blocks.
    ~ManagedThread();
    ManagedThread(const ManagedThread&) = delete;
    ManagedThread& operator=(const ManagedThread&) = delete;

    // Abandons the thread held, and takes ownership of `thread`, which may be null.
    void Assign(boost::thread* thread);

    // Waits up to `seconds` for the thread to end. True if it ended and is held no more; false if
    // it didn't, if no thread is held, or if the caller is that thread. Call it without a lock that
    // the thread needs.
    bool TimedJoin(double seconds);

    // The same without a limit.
    void Join();

    // Lets go of the thread, which runs on and stays registered until the process ends.
    void Abandon();

    bool HoldsThread() const { return fThread != nullptr; }

    // A share of the thread held, empty if none is. A thread that is joined while somebody has one
    // stays registered.
    boost::shared_ptr<boost::thread> GetThread() const { return fThread; }

    void SetName(const char* name);

    // How many threads are registered: those held, and those abandoned. Any thread may ask.
    static std::size_t GetRegisteredThreadCount();

private:
    void Forget();

    boost::mutex* fRegistryMutex;
    ManagedThreadRegistry* fRegistry;
    boost::shared_ptr<boost::thread> fThread;
    std::string fName;
};

} // namespace pmutil
