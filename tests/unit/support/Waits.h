// Waits of the tests, and the waits of the supervision that a test may set.
#pragma once

#include <chrono>
#include <thread>

#include "pmutil/PMLogging.h"

namespace pmutil {

// Longer than anything takes, on a busy machine and in a process that is stopped most of the time.
constexpr double kLong = 300.0;

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

// Sets the short wait for as long as it lives. How long a test's machine takes must not matter: a
// test that is about giving up has none, and every other one a long one.
class ShortWait : public DebugValueSetter {
public:
    explicit ShortWait(int seconds)
        : DebugValueSetter("ConsoleAppShortWaitSecondsMinusOne", seconds - 1)
    {}
};

// A short wait that nothing comes to the end of.
class LongShortWait : public ShortWait {
public:
    LongShortWait() : ShortWait(600) {}
};

// The short wait is no wait at all. No thread of a launch may come to a short wait of its own
// meanwhile, unless it is to run out.
class NoShortWait : public ShortWait {
public:
    NoShortWait() : ShortWait(0) {}
};

} // namespace pmutil
