// Waits of the tests, and the waits of the supervision that a test may set.
#pragma once

#include <chrono>
#include <thread>

#include "pmutil/PMLogging.h"

namespace pmutil {

// Longer than anything takes on a machine that works.
constexpr double kLong = 60.0;

// True as soon as the condition holds; false if it doesn't within kLong.
template <typename Condition>
bool Eventually(const Condition& condition)
{
    const auto end = std::chrono::steady_clock::now() + std::chrono::duration<double>(kLong);
    while (!condition()) {
        if (std::chrono::steady_clock::now() > end)
            return false;
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    return true;
}

// Sets a debug value for as long as it lives. `name` must be a literal.
class DebugValueSetter {
public:
    DebugValueSetter(const char* name, int value) : fValue(name, 0)
    {
        InitLogging(); // no name is known before
        fOld = GetDebugValue(fValue).exchange(value);
    }
    ~DebugValueSetter() { GetDebugValue(fValue) = fOld; }
    DebugValueSetter(const DebugValueSetter&) = delete;
    DebugValueSetter& operator=(const DebugValueSetter&) = delete;

private:
    DebugValue fValue;
    int fOld = 0;
};

// Makes the short wait no wait at all for as long as it lives. No thread of a launch may come to a
// short wait of its own meanwhile.
class NoShortWait : public DebugValueSetter {
public:
    NoShortWait() : DebugValueSetter("ConsoleAppShortWaitSecondsMinusOne", -1) {}
};

} // namespace pmutil
