// Waiting for the end of a thread, by any number of threads, and threads that destroy their task
// when it has run.
#pragma once

#include <memory>
#include <utility>

#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

namespace pmutil {

// The end of a thread. Unlike with a join, several threads may wait.
class ThreadEnd {
public:
    // The thread calls Begin first and End last.
    void Begin();
    void End();

    bool HasEnded() const;

    // Waits up to `seconds` for the end and returns whether the thread has ended. Returns at once
    // on the thread itself and after GiveUp.
    bool Await(double seconds) const;

    // Ends all present and later waits.
    void GiveUp();

private:
    mutable boost::mutex fMutex;
    mutable boost::condition_variable fCond;
    boost::thread::id fThread;
    bool fEnded = false;
    bool fGivenUp = false;
};

// Starts a thread that calls a copy of `task` and then destroys the copy, since the thread's object
// may stay registered until the process ends. After that, `end`, if not empty, is set.
template <typename Task>
std::unique_ptr<boost::thread> StartThread(const Task& task,
                                           const boost::shared_ptr<ThreadEnd>& end = nullptr)
{
    return std::make_unique<boost::thread>([copy = boost::make_shared<Task>(task), end]() mutable {
        if (end != nullptr)
            end->Begin();
        (*copy)();
        copy.reset();
        if (end != nullptr)
            end->End();
    });
}

} // namespace pmutil
