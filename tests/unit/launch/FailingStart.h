// A launch in which the thread of an output task fails before the task runs.
#pragma once

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <optional>
#include <string>

#include "Journal.h"
#include "RecordingLogger.h"
#include "support/Waits.h"

namespace pmutil {

// The launcher's thread waits the whole short wait for such a task, and fails the launch with
// "never started" if the other failure comes only after that. In the first launch after the
// construction, the launcher's thread checks for the task of the channel when the failure of its
// thread is stored, and only once: the order doesn't depend on time.
class FailingStart : public PMLogger {
public:
    explicit FailingStart(std::string channel)
        : PMLogger("failing start"), fChannel(std::move(channel))
    {}

    void Write(const char* data, std::size_t size) override { fLine.append(data, size); }

    void Flush() override
    {
        const std::string message = MessageOf(fLine);
        fLine.clear();
        if (Get(fLooked))
            return;
        const auto begins = [&](const std::string& text) { return message.rfind(text, 0) == 0; };
        if (begins("NotifyFailureLocked: exc=" + fChannel + ": ")) {
            Set(fStored);
        } else if (begins("LaunchThreadTask OutputThreadTask spawned, use_count[" + fChannel)) {
            Await(fStored);
            fNoWait.emplace();
        } else if (begins("OutputTask::IsRunning " + fChannel + " ")) {
            fNoWait.reset();
            Set(fLooked);
        } else if (begins("ThrowIfFailurePendingLocked throwing")) {
            Await(fLooked); // the client's next wait is a short wait too
        }
    }

private:
    bool Get(const bool& event)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        return event;
    }

    void Set(bool& event)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        event = true;
        fCond.notify_all();
    }

    void Await(const bool& event)
    {
        Journal::WithoutLogMutex([&] {
            boost::unique_lock<boost::mutex> lock(fMutex);
            while (!event)
                fCond.wait(lock);
        });
    }

    const DebugValueSetter fLog{"ConsoleAppLog", 1};
    const std::string fChannel;
    std::string fLine;
    std::optional<NoShortWait> fNoWait;
    boost::mutex fMutex;
    boost::condition_variable fCond;
    bool fStored = false; // the failure
    bool fLooked = false; // for the task
};

} // namespace pmutil
