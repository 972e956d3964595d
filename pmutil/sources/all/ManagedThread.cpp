#include "pmutil/ManagedThread.h"

#include <algorithm>
#include <charconv>
#include <utility>
#include <vector>

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread_time.hpp>

#include "all/ConsoleAppLog.h"
#include "all/WaitTime.h"
#include "pmutil/System.h"
#include "pmutil/Threads.h"

namespace pmutil {

// One entry for each thread that was started and not joined.
struct ManagedThreadRegistry {
    std::vector<boost::shared_ptr<boost::thread>> threads;
    std::size_t count = 0;
};

namespace {

DebugValue gManagedThreadLog{"ManagedThreadLog", 0};

// Both are never destroyed: an abandoned thread may run until the process ends.
boost::mutex& GetRegistryMutex()
{
    static boost::mutex& mutex = *new boost::mutex;
    return mutex;
}

ManagedThreadRegistry& GetRegistry()
{
    static ManagedThreadRegistry& registry = *new ManagedThreadRegistry;
    return registry;
}

// Returns the time until `deadline`, plus one millisecond so that the join doesn't end too early.
boost::posix_time::time_duration GetJoinTime(const boost::posix_time::ptime& deadline)
{
    const auto left = deadline - boost::get_system_time();
    if (left.is_special() || left.is_negative() || left.ticks() == 0)
        return boost::posix_time::milliseconds(0);
    return boost::posix_time::milliseconds(left.total_milliseconds() + 1);
}

// Keys are thread id texts.
struct ThreadNameTable {
    using Entry = std::pair<std::string, std::string>;

    boost::mutex mutex;
    std::vector<Entry> entries;

    // Returns null if the thread has no name. Call it with the mutex held.
    Entry* Find(const std::string& key)
    {
        const auto found = std::find_if(entries.begin(), entries.end(),
                                        [&](const Entry& entry) { return entry.first == key; });
        return found == entries.end() ? nullptr : &*found;
    }
};

ThreadNameTable& GetThreadNameTable()
{
    static ThreadNameTable& table = *new ThreadNameTable; // never destroyed
    return table;
}

} // namespace

void SetCurrentThreadName(const std::string& name)
{
    ShowThreadName(name);
    ThreadNameTable& table = GetThreadNameTable();
    const boost::lock_guard<boost::mutex> lock(table.mutex);
    std::string key = GetCurrentThreadIDString();
    if (ThreadNameTable::Entry* const entry = table.Find(key))
        entry->second = name;
    else
        table.entries.emplace_back(std::move(key), name);
}

std::string GetCurrentThreadName()
{
    ThreadNameTable& table = GetThreadNameTable();
    const boost::lock_guard<boost::mutex> lock(table.mutex);
    std::string key = GetCurrentThreadIDString();
    const ThreadNameTable::Entry* const entry = table.Find(key);
    return entry != nullptr ? entry->second : key;
}

std::string GetCurrentThreadIDString()
{
    return MakeThreadIDString(GetCurrentThreadNumber());
}

std::string MakeThreadIDString(std::uint64_t number)
{
    if (number == 0)
        return "{Not-any-thread}";
    char digits[16];
    const auto end = std::to_chars(std::begin(digits), std::end(digits), number, 16).ptr;
    return std::string(digits, end);
}

ManagedThread::ManagedThread(const char* name)
    : fRegistryMutex(&GetRegistryMutex()),
      fRegistry(&GetRegistry()),
      fName(name != nullptr ? name : "")
{}

ManagedThread::~ManagedThread()
{
    Abandon();
}

void ManagedThread::Assign(boost::thread* thread)
{
    Abandon();
    if (thread == nullptr)
        return;
    const boost::lock_guard<boost::mutex> lock(*fRegistryMutex);
    fThread.reset(thread);
    fRegistry->threads.push_back(fThread);
    ++fRegistry->count;
}

bool ManagedThread::TimedJoin(double seconds)
{
    // A thread that joins itself would wait forever.
    if (fThread == nullptr || fThread->get_id() == boost::this_thread::get_id())
        return false;
    const boost::posix_time::ptime deadline = boost::get_system_time() + ToWaitDuration(seconds);
    if (deadline.is_pos_infinity())
        fThread->join();
    else if (!fThread->timed_join(GetJoinTime(deadline)))
        return false;
    Forget();
    return true;
}

void ManagedThread::Join()
{
    if (fThread == nullptr)
        return;
    fThread->join();
    Forget();
}

void ManagedThread::Abandon()
{
    if (fThread == nullptr)
        return;
    DebugValue& log = GetDebugValue(gManagedThreadLog) != 0 ? gManagedThreadLog : gConsoleAppLog;
    PM_LOG(log, "thread " << fName << " was abandoned");
    fThread.reset();
}

void ManagedThread::SetName(const char* name)
{
    fName = name != nullptr ? name : "";
}

std::size_t ManagedThread::GetRegisteredThreadCount()
{
    const boost::lock_guard<boost::mutex> lock(GetRegistryMutex());
    return GetRegistry().count;
}

void ManagedThread::Forget()
{
    const boost::lock_guard<boost::mutex> lock(*fRegistryMutex);
    constexpr long kThisAndTheRegistry = 2;
    auto& threads = fRegistry->threads;
    if (fThread.use_count() == kThisAndTheRegistry && !threads.empty()) {
        threads.erase(std::find(threads.begin(), threads.end(), fThread));
        --fRegistry->count;
    }
    fThread.reset();
}

} // namespace pmutil
