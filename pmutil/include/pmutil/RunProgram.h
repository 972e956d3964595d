// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Runs a console program as a child with a timeout, and returns how it ended and what it wrote.
//
//     pmutil::RunOptions options;
//     options.fTimeoutSeconds = 60;
//     const pmutil::RunResult run = pmutil::RunProgram("/usr/bin/thing", {"-x", "a b"}, options);
//     if (run.fEnd == pmutil::State::kFinished && run.fExitCode == 0)
//         Use(run.fOutput);
#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <string>
#include <vector>

#include <boost/shared_ptr.hpp>

#include "pmutil/ConsoleAppTypes.h"
#include "pmutil/Launcher.h"
#include "pmutil/OutputPump.h"
#include "pmutil/StopRequest.h"

namespace pmutil {

struct RunOptions {
    // The program is killed if it is still running this long after the call. No limit by default.
    double fTimeoutSeconds = std::numeric_limits<double>::infinity();

    // Receive standard output and standard error while the program runs, instead of RunResult's
    // texts: blocks, or lines with ByLine. Each is called on a separate thread. RunProgram waits
    // for a call in progress, and makes no call after it has returned. If a function throws, the
    // program is killed, and RunProgram throws the same exception.
    TakeBytes fTakeOutput;
    TakeBytes fTakeErrors;

    // The maximum size of each text of RunResult. Bytes beyond it are dropped and counted.
    std::size_t fMaxKeptBytes = std::size_t{64} << 20;

    // Kills the program when it is raised, by any thread. Not owned; may be null.
    StopRequest* fStop = nullptr;

    // Starts the program; used for this run only. Empty: the platform's launcher.
    boost::shared_ptr<Launcher> fLauncher;
};

struct RunResult {
    // Finished: the program exited with fExitCode.
    // Crashed: a signal ended it, or on Windows it exited with a code above 255.
    // Killed: RunProgram killed it, because of fTimedOut or fStopped.
    // Timeout: it was killed but did not end within the default wait (10 s). It is left behind.
    // Idle: it was not started, because fStop was raised before.
    State fEnd = State::kIdle;
    int fExitCode = 0;            // 0 to 255; 0 unless Finished
    std::string fTerminationText; // if Crashed or Killed: "signal 11 (Segmentation fault)"
    bool fTimedOut = false;
    bool fStopped = false;

    std::string fOutput; // everything written to standard output; empty with fTakeOutput
    std::string fErrors; // the same for standard error
    std::uint64_t fDroppedBytes = 0;

    // Another process holds an output of the program open. The bytes that it writes are missing.
    bool fIsOutputOpen = false;
};

// `program` and `args` are those of MakeChildCommand: the program receives exactly these arguments.
// It has the environment and the current directory of this process, and an empty standard input.
//
// Returns when the program has ended and its output is closed. If another process holds the output
// open, returns no later than the short wait (1 s) after the program's end. Processes that the
// program started are not killed.
//
// Throws consoleapp::Exception if the program can't be started or waited for, or its output can't
// be read: "Launcher: posix_spawn failed: /usr/bin/thing: No such file or directory". Throws
// std::invalid_argument as MakeChildCommand does, and boost::thread_interrupted if this thread is
// interrupted. In each case a running program is killed.
//
// Any number of threads may call it at the same time.
RunResult RunProgram(const std::string& program, const std::vector<std::string>& args,
                     const RunOptions& options = {});

} // namespace pmutil
