// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Owns a running thread, which can be joined with a timeout or abandoned.
//
// A process-wide registry, which is never destroyed, keeps the objects of abandoned threads alive.
// Use a ManagedThread from one thread at a time.
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
    // `name` is a label for log lines; null is an empty label.
    explicit ManagedThread(const char* name = nullptr);

    // Abandons the thread, if one is held; never blocks.
    ~ManagedThread();
    ManagedThread(const ManagedThread&) = delete;
    ManagedThread& operator=(const ManagedThread&) = delete;

    // Abandons the present thread and takes ownership of `thread`, which may be null.
    void Assign(boost::thread* thread);

    // Waits up to `seconds` for the thread to end. Returns true if it has ended; it is then no
    // longer held. Returns false on a timeout, if no thread is held, or if the caller is that
    // thread. Don't hold a lock that the thread needs.
    bool TimedJoin(double seconds);

    // Waits for the thread to end, without a limit. Does nothing if no thread is held.
    void Join();

    // Releases the thread without waiting. It keeps running and stays registered until the process
    // ends.
    void Abandon();

    bool HoldsThread() const { return fThread != nullptr; }

    // Returns the thread held, empty if there is none. If a caller still shares it when it is
    // joined, the thread stays registered.
    boost::shared_ptr<boost::thread> GetThread() const { return fThread; }

    // Replaces the label.
    void SetName(const char* name);

    // Returns the number of registered threads, held and abandoned ones. Any thread may call it.
    static std::size_t GetRegisteredThreadCount();

private:
    void Forget();

    boost::mutex* fRegistryMutex;
    ManagedThreadRegistry* fRegistry;
    boost::shared_ptr<boost::thread> fThread;
    std::string fName;
};

} // namespace pmutil
