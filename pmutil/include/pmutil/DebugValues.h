// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Named debug values: process-wide integers, looked up by name, that control logging and a few
// delays. They can't be set from outside the process; a value is 0, or its declared initial value,
// until the program writes it.
#pragma once

#include <atomic>
#include <cstdint>

namespace pmutil {

// A named debug value, declared as a static next to the code that uses it:
//
//     DebugValue gLog{"ConsoleAppLog", 0};
//
// Records with the same name share one value. `name` must stay valid until the process ends; use a
// string literal.
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

// A debug value. Any thread may read and write it.
using DebugInteger = std::atomic<std::int32_t>;

// Reserved as the name for setting debug values from outside. Unused.
inline constexpr char kDebugFlagsName[] = "AssayDebugFlags";

namespace detail {
// Slot 0 belongs to records that aren't resolved yet, so 100 names fit. Its value is not 0, so that
// MayBeSet returns true for such records.
inline constexpr std::int32_t kDebugValueSlots = 101;
extern DebugInteger gDebugValues[kDebugValueSlots];

// Returns false if the record's value is known to be 0. This is the whole cost of a disabled log
// statement.
inline bool MayBeSet(const DebugValue& record)
{
    const std::int32_t index = record.index.load(std::memory_order_acquire);
    return gDebugValues[index].load(std::memory_order_relaxed) != 0;
}

// The slow path of GetDebugValue: finds or assigns the name's slot under the log mutex.
DebugInteger& ResolveDebugValue(DebugValue& record);

// Enables the resolution of names. InitLogging calls it with the log mutex held.
void PrepareDebugValues();
} // namespace detail

// Returns the value that `record` names. The first call after InitLogging resolves the name under
// the log mutex and stores the record's initial value; later calls cost a load and a test.
//
// Before InitLogging, and for all names beyond the hundredth, returns a shared overflow value; the
// record then stays unresolved. The reference is valid until the process ends.
inline DebugInteger& GetDebugValue(DebugValue& record)
{
    const std::int32_t index = record.index.load(std::memory_order_acquire);
    return index != 0 ? detail::gDebugValues[index] : detail::ResolveDebugValue(record);
}

} // namespace pmutil
