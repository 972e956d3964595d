// The end of a thread, which any number of threads may wait for, and threads that release their
// task when they end.
#pragma once

#include <memory>
#include <utility>

#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

namespace pmutil {

// Unlike a join, which is for one thread at a time.
class ThreadEnd {
public:
    // For the thread: its first and its last statement.
    void Begin();
    void End();

    bool HasEnded() const;

    // Waits up to `seconds` for the end. False if it doesn't come: at once on the thread itself,
    // and as soon as the thread is given up.
    bool Await(double seconds) const;

    // Ends all waits, now and later.
    void GiveUp();

private:
    mutable boost::mutex fMutex;
    mutable boost::condition_variable fCond;
    boost::thread::id fThread;
    bool fEnded = false;
    bool fGivenUp = false;
};

// Starts a thread on a copy of `task`, which is destroyed when it has run, as the thread's object
// may stay registered for ever. `end`, unless empty, is set after that.
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
