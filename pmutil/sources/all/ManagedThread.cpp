#include <algorithm>
#include <charconv>
#include <utility>
#include <vector>

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/System.h"
#include "pmutil/Threads.h"

namespace pmutil {

namespace {

// Keys are thread id texts.
struct ThreadNameTable {
    using Entry = std::pair<std::string, std::string>;

    boost::mutex mutex;
    std::vector<Entry> entries;

    // With the mutex held; null if the thread was never named.
    Entry* Find(const std::string& key)
    {
        const auto found = std::find_if(entries.begin(), entries.end(),
                                        [&](const Entry& entry) { return entry.first == key; });
        return found == entries.end() ? nullptr : &*found;
    }
};

ThreadNameTable& GetThreadNameTable()
{
    static ThreadNameTable& table = *new ThreadNameTable; // outlives all threads
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

} // namespace pmutil
