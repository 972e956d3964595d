// The clock of the program app_tests: it replaces pmutil's.
#pragma once

// While it exists, the clock is at 0 and goes on by `step` seconds at each reading.
class SteppingClock {
public:
    explicit SteppingClock(double step);
    ~SteppingClock();
    SteppingClock(const SteppingClock&) = delete;
    SteppingClock& operator=(const SteppingClock&) = delete;

    double fSeconds = 0; // of the last reading
    const double fStep;
};
