#include "pmutil/DebugValues.h"

#include <functional>
#include <map>
#include <string>

#include <boost/thread/lock_guard.hpp>

#include "all/LogTimer.h"
#include "pmutil/PMLogging.h"

namespace pmutil {

namespace detail {
DebugInteger gDebugValues[kDebugValueSlots] = {{1}};
} // namespace detail

namespace {

DebugInteger gOverflow{0};
bool gPrepared = false; // guarded by the log mutex

// Returns 0 if the name is new and all slots are assigned. Call it with the log mutex held.
std::int32_t FindOrAddSlot(const DebugValue& record)
{
    using Slots = std::map<std::string, std::int32_t, std::less<>>;
    static Slots& slots = *new Slots; // never destroyed
    const auto known = slots.find(record.name);
    if (known != slots.end())
        return known->second;
    const auto slot = static_cast<std::int32_t>(slots.size()) + 1;
    if (slot >= detail::kDebugValueSlots)
        return 0;
    slots.emplace(record.name, slot);
    detail::gDebugValues[slot] = record.initial;
    return slot;
}

} // namespace

DebugInteger& detail::ResolveDebugValue(DebugValue& record)
{
    const LogTimer timer;
    const boost::lock_guard<boost::recursive_mutex> lock(GetLogMutex());
    const std::int32_t slot = gPrepared ? FindOrAddSlot(record) : 0;
    if (slot == 0)
        return gOverflow;
    record.index.store(slot, std::memory_order_release);
    return gDebugValues[slot];
}

void detail::PrepareDebugValues()
{
    gPrepared = true;
}

} // namespace pmutil
