// Measures the time that the process spends in logging.
#pragma once

namespace pmutil {

// Make one at the start of each entry point of the logging system. The outermost of nested timers
// adds the time of its scope to GetLogTime.
class LogTimer {
public:
    LogTimer();
    ~LogTimer();
    LogTimer(const LogTimer&) = delete;
    LogTimer& operator=(const LogTimer&) = delete;

private:
    bool fOutermost;
    double fStartTime = 0;
};

} // namespace pmutil
