// Named debug values: process-wide integers, looked up by name, that govern logging and a few
// delays. Nothing outside the process sets them; a value is 0 (or its declared initial) until the
// program itself writes it.
#pragma once

#include <atomic>
#include <cstdint>

namespace pmutil {

// A named debug value, declared as a static next to the code that uses it:
//
//     DebugValue gLog{"ConsoleAppLog", 0};
//
// Two records with one name share one value. `name` must outlive the process's use of it; a string
// literal does.
struct DebugValue {
    const char* name;
    std::int32_t initial;
    std::atomic<std::int32_t> index{0}; // slot number, 0 until the name is resolved

    constexpr DebugValue(const char* valueName, std::int32_t initialValue) noexcept
        : name(valueName), initial(initialValue)
    {}
    DebugValue(const DebugValue&) = delete;
    DebugValue& operator=(const DebugValue&) = delete;
};

// The value behind a record, to be read and written directly from any thread.
using DebugInteger = std::atomic<std::int32_t>;

// The name under which a process would be handed such values from outside. Nothing reads it.
inline constexpr char kDebugFlagsName[] = "AssayDebugFlags";

namespace detail {
// Slot 0 is never assigned, so 100 names fit. It isn't 0, so that a record that isn't resolved yet
// reads as one that may be set.
inline constexpr std::int32_t kDebugValueSlots = 101;
extern DebugInteger gDebugValues[kDebugValueSlots];

// False if the value behind the record is known to be 0. What a log statement costs while it is
// off.
inline bool MayBeSet(const DebugValue& record)
{
    const std::int32_t index = record.index.load(std::memory_order_acquire);
    return gDebugValues[index].load(std::memory_order_relaxed) != 0;
}

// The slow road of GetDebugValue: finds or makes the name's slot under the log mutex.
DebugInteger& ResolveDebugValue(DebugValue& record);

// Lets names be resolved from now on; called by InitLogging with the log mutex held.
void PrepareDebugValues();
} // namespace detail

// The integer that `record` names. A load and a test once the name is resolved; the first call
// after InitLogging resolves it under the log mutex and stores the record's initial value.
//
// Before InitLogging, and for every name beyond the hundredth, the result is one shared overflow
// integer, and nothing is cached. The reference stays valid until the process ends.
inline DebugInteger& GetDebugValue(DebugValue& record)
{
    const std::int32_t index = record.index.load(std::memory_order_acquire);
    return index != 0 ? detail::gDebugValues[index] : detail::ResolveDebugValue(record);
}

} // namespace pmutil
