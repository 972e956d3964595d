// The events of a launch, in order for each party: log lines, calls of the platform's launcher,
// notifications and the steps of the output tasks.
#pragma once

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>
#include <functional>
#include <gtest/gtest.h>
#include <map>
#include <regex>
#include <string>
#include <vector>

#include "RecordingLogger.h"
#include "ThreadsEnd.h"
#include "support/Waits.h"

namespace pmutil {

// A logger that accepts entries from other sources too. The first line of a thread identifies it;
// the thread that constructs the journal is the client.
class Journal : public PMLogger {
public:
    using Entries = std::vector<std::string>;

    Journal() : PMLogger("journal") { fParties[boost::this_thread::get_id()] = "Client"; }

    // For any other thread, before its first entry: thread ids are reused.
    void Enter(const std::string& party)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fParties[boost::this_thread::get_id()] = party;
    }

    void Write(const char* data, std::size_t size) override { fLine.append(data, size); }

    void Flush() override
    {
        std::string message = MessageOf(fLine);
        fLine.clear();
        if (!message.empty() && message.back() == '\n')
            message.pop_back();
        Add(message);
        if (fOnLine)
            fOnLine(message);
    }

    // Called for each line, on its thread and with the log mutex held as often as kLogLocks says.
    static constexpr int kLogLocks = 2;
    void SetOnLine(std::function<void(const std::string& line)> onLine)
    {
        const boost::lock_guard<boost::recursive_mutex> lock(GetLogMutex());
        fOnLine = std::move(onLine);
    }

    // For the function of SetOnLine: other threads may log during the call.
    template <typename Call>
    static void WithoutLogMutex(Call call)
    {
        for (int lock = 0; lock < kLogLocks; ++lock)
            GetLogMutex().unlock();
        call();
        for (int lock = 0; lock < kLogLocks; ++lock)
            GetLogMutex().lock();
    }

    // The same, until the party has an entry with this beginning.
    void AwaitWithoutLogMutex(const std::string& party, const std::string& begin)
    {
        WithoutLogMutex([&] { Await(party, begin); });
    }

    // Adds an entry of the calling thread. Measured times are removed.
    void Add(const std::string& entry)
    {
        static const std::regex measured("(waitSeconds=|TimedJoin\\()[1-9][0-9.e+]*");
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fEntries[Identify(entry)].push_back(std::regex_replace(entry, measured, "$1..."));
        fCond.notify_all();
    }

    // Returns the entries of the party since the last call.
    Entries Take(const std::string& party)
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        const Entries& all = fEntries[party];
        std::size_t& taken = fTaken[party];
        Entries fresh(all.begin() + static_cast<std::ptrdiff_t>(taken), all.end());
        taken = all.size();
        return fresh;
    }

    // Waits until the party has this many entries with this beginning, whether or not returned.
    void Await(const std::string& party, const std::string& begin, int count = 1)
    {
        boost::unique_lock<boost::mutex> lock(fMutex);
        const auto hasCome = [&] {
            int found = 0;
            for (const std::string& entry : fEntries[party])
                found += entry.rfind(begin, 0) == 0 ? 1 : 0;
            return found >= count;
        };
        EXPECT_TRUE(
            fCond.timed_wait(lock, boost::posix_time::seconds(static_cast<long>(kLong)), hasCome))
            << party << " never came to: " << begin;
    }

private:
    std::string Identify(const std::string& entry)
    {
        std::string& party = fParties[boost::this_thread::get_id()];
        const std::string output = "LaunchOutputThreadTask::operator()() fOutputChannel=";
        if (entry == "LaunchThreadTask::operator()()")
            party = "Launcher";
        else if (entry.rfind(output, 0) == 0)
            party = entry.substr(output.size());
        return party;
    }

    boost::mutex fMutex;
    boost::condition_variable fCond;
    std::string fLine;
    std::map<boost::thread::id, std::string> fParties;
    std::map<std::string, Entries> fEntries;
    std::map<std::string, std::size_t> fTaken;
    std::function<void(const std::string& line)> fOnLine; // under the log mutex
};

} // namespace pmutil
