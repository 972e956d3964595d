// Measures how long the process spends in logging.
#pragma once

namespace pmutil {

// Stands at the head of every entry point of the logging system. The outermost one of nested calls
// adds the time of its scope to what GetLogTime gives.
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
