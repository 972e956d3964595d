// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Runs a program with a timeout, prints its lines as they arrive, and then how it ended.
//
// usage: run_assay PROGRAM SECONDS [argument...]
#include <cstdlib>
#include <iostream>

#include <boost/nowide/args.hpp>

#include "pmutil/RunProgram.h"

int main(int argc, char** argv)
try {
    const boost::nowide::args utf8(argc, argv); // on Windows, converts them from UTF-16
    if (argc < 3) {
        std::cerr << "usage: run_assay PROGRAM SECONDS [argument...]\n";
        return 2;
    }
    pmutil::RunOptions options;
    options.fTimeoutSeconds = std::atof(argv[2]);
    options.fTakeOutput = pmutil::ByLine([](auto line) { std::cout << line << std::endl; });
    options.fTakeErrors = pmutil::ByLine([](auto line) { std::cerr << line << std::endl; });
    const pmutil::RunResult run = pmutil::RunProgram(argv[1], {argv + 3, argv + argc}, options);
    std::cerr << "Verdict: " << run.fEnd << ", exit code " << run.fExitCode << '\n';
    return run.fEnd == pmutil::State::kFinished ? run.fExitCode : 3;
} catch (const std::exception& failure) {
    std::cerr << "Verdict: no run, " << failure.what() << '\n';
    return 4;
}
