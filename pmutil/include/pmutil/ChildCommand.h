// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Makes the command of a child so that it receives exactly the given arguments. Any thread may
// call.
#pragma once

#include <deque>
#include <string>
#include <vector>

namespace pmutil {

// The program and the arguments for a LaunchParams.
struct ChildCommand {
    std::wstring fProgram;
    std::deque<std::string> fArgs;
};

// `program` is a path; all texts are UTF-8.
//
// On Windows fProgram is the whole command line, which the launcher passes on unchanged: the
// launcher's own quoting can't express every argument. CommandLineToArgvW and the C runtime parse
// the arguments back unchanged, but invalid UTF-8 becomes U+FFFD. The path is quoted, so that
// "C:\My.exe" is never tried for "C:\My Programs\p.exe". `program` must not be a batch file, which
// cmd.exe would run, with other parsing rules.
//
// Throws std::invalid_argument "ChildCommand: zero byte" if a text contains one, and on Windows
// "ChildCommand: quotation mark in the path", which no path can contain.
ChildCommand MakeChildCommand(const std::string& program, const std::vector<std::string>& args);

} // namespace pmutil
