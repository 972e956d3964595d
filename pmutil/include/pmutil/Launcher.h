// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// The system calls of a launch: starts a program with pipes as its standard streams, waits for it,
// kills it.
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

// One launch at a time, any number in sequence: Wait and Kill apply to the latest child. A failure
// throws std::runtime_error with the name of the system call.
class Launcher {
public:
    Launcher() = default;
    virtual ~Launcher() = default;
    Launcher(const Launcher&) = delete;
    Launcher& operator=(const Launcher&) = delete;

    // Starts the program. The child inherits the environment and the current directory, and gets
    // the other ends of three new pipes; this process closes those.
    virtual LaunchResult Launch(const std::wstring& program,
                                const std::deque<std::string>& args) = 0;

    // Waits without a limit for the end of the child. Sets `*exitCode` to its exit code, 0 to 255,
    // only if it ended normally.
    virtual WaitResult Wait(int* exitCode) = 0;

    // Kills the child; does nothing if it has ended. Any thread may call it, also repeatedly.
    virtual void Kill() = 0;
};

// Returns a new launcher of this platform.
boost::shared_ptr<Launcher> MakeLauncher();

// Returns what ended the latest child of a launcher of this platform, such as "signal 11
// (Segmentation fault)" or "code 0xC0000005". Empty after an exit code of 0 to 255, before Wait has
// returned, and for other launchers. Any thread may call it.
std::string GetTerminationText(const Launcher& launcher);

} // namespace pmutil
