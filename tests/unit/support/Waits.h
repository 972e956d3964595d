// Waits of the tests, and the waits of launches that a test can set.
#pragma once

#include <chrono>
#include <thread>

#include "pmutil/PMLogging.h"

namespace pmutil {

// Seconds; longer than any operation on a busy machine and in a process that is stopped most of the
// time.
constexpr double kLong = 300.0;

// Waits until the condition is true. Returns false if it isn't within kLong.
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

// Sets a debug value while it exists. `name` must be a literal.
class DebugValueSetter {
public:
    DebugValueSetter(const char* name, int value) : fValue(name, 0)
    {
        InitLogging(); // required to resolve the name
        fOld = GetDebugValue(fValue).exchange(value);
    }
    ~DebugValueSetter() { GetDebugValue(fValue) = fOld; }
    DebugValueSetter(const DebugValueSetter&) = delete;
    DebugValueSetter& operator=(const DebugValueSetter&) = delete;

private:
    DebugValue fValue;
    int fOld = 0;
};

// Sets the short wait while it exists. So that tests don't depend on the machine's speed, tests of
// launches that are given up use no short wait, and all others a long one.
class ShortWait : public DebugValueSetter {
public:
    explicit ShortWait(int seconds)
        : DebugValueSetter("ConsoleAppShortWaitSecondsMinusOne", seconds - 1)
    {}
};

// A short wait that never times out.
class LongShortWait : public ShortWait {
public:
    LongShortWait() : ShortWait(600) {}
};

// A short wait of 0 seconds. Meanwhile every short wait of a launch's threads times out at once.
class NoShortWait : public ShortWait {
public:
    NoShortWait() : ShortWait(0) {}
};

} // namespace pmutil
