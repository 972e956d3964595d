// The platform's side of a launch: starts a program with its standard streams on pipes, waits for
// it, kills it.
#pragma once

#include <deque>
#include <string>

#include <boost/shared_ptr.hpp>

#include "pmutil/ConsoleAppTypes.h"
#include "pmutil/Reader.h"
#include "pmutil/Writer.h"

namespace pmutil {

// The parent's ends of a child's pipes.
struct LaunchResult { // NOLINT(bugprone-reserved-identifier): clang's name for copying the array
    boost::shared_ptr<Writer> fAppInput;
    boost::shared_ptr<Reader> fAppOutput[kOutputSlots]; // indexed by TaskID; entry 0 stays empty
};

// How a child ended.
enum WaitResult : int { kEndedNormally = 0, kEndedByCrash = 1, kEndedByKill = 2 };

// Serves one launch at a time, and any number in turn: Wait and Kill mean the latest child.
// Failures throw std::runtime_error with the name of the system's call.
class Launcher {
public:
    Launcher() = default;
    virtual ~Launcher() = default;
    Launcher(const Launcher&) = delete;
    Launcher& operator=(const Launcher&) = delete;

    // Starts the program. The child gets the environment and the current directory of this process,
    // and the other ends of three new pipes, which this process doesn't keep.
    virtual LaunchResult Launch(const std::wstring& program,
                                const std::deque<std::string>& args) = 0;

    // Waits without limit until the child ends. `exitCode` gets its code, 0 to 255, if it ended
    // normally, and is left alone otherwise.
    virtual WaitResult Wait(int* exitCode) = 0;

    // Ends the child by force; one that is gone already is no error. Any thread may call it, and
    // more than once.
    virtual void Kill() = 0;
};

// The launcher of this platform.
boost::shared_ptr<Launcher> MakeLauncher();

// What ended the latest child of this platform's launcher, if it was no exit code of 0 to 255:
// "signal 11 (Segmentation fault)" or "code 0xC0000005". Empty before the end was waited for, and
// for any other launcher. Any thread may ask.
std::string GetTerminationText(const Launcher& launcher);

} // namespace pmutil
