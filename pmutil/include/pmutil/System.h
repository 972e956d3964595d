// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Machine and process services. Each platform has its own source file; the callers have the logic.
#pragma once

#include <cstdint>
#include <cstdio>
#include <string>

namespace pmutil {

// Returns the seconds since 1970-01-01 UTC, with the resolution of the system clock. Any thread.
double GetClockSeconds();

// Returns the operating system's numeric id of the calling thread.
std::uint64_t GetCurrentThreadNumber();

// Sets the calling thread's name for debuggers and system tools; does nothing if the platform
// can't.
void ShowThreadName(const std::string& name);

// Returns the total physical memory in bytes. Throws std::runtime_error
// "GlobalMemoryStatusEx failed" if it is unknown.
std::uint64_t GetPhysicalMemoryBytes();

// Returns the user's desktop folder, empty if it is unknown. On Linux: XDG_DESKTOP_DIR of the
// user's user-dirs file, else "Desktop" in the home folder of the password database.
std::wstring GetDesktopFolder();

// Returns the process's current directory. Throws std::runtime_error "GetCurrentDirectoryW failed".
std::wstring GetCurrentDirectoryPath();

// Opens a file for appending; other processes may read it meanwhile. Returns null on failure.
std::FILE* OpenSharedAppend(const std::string& path);

// Discards the unwritten bytes of `stream` after a failed write and clears its error indicator, so
// that the lost line isn't written with a later one.
void DiscardUnwritten(std::FILE* stream);

// Makes the process independent of how it was started. Call it first in main, before any thread.
// - A crash opens no dialog and leaves no core dump. On Linux, if the hard core limit is 0, an
//   unprivileged process can't raise it, and a crash reporter of core_pattern still gets the crash.
// - A write to a pipe without a reader or beyond the file-size limit fails and doesn't end the
//   process; a write to the terminal of another job succeeds and doesn't stop it.
// - On Windows, abort() ends the process with code 0xC0000409 instead of status 3, an unhandled
//   exception ends it with its own code, and no library is loaded from the current directory.
// - On Linux, no signal is blocked, and the signals of crashes and of a child's end aren't ignored.
//   Other signals keep their disposition: SIGHUP stays ignored under nohup, SIGXCPU ends the
//   process at its CPU limit, SIGTTIN and SIGTSTP stop it.
// - A closed standard stream keeps failing: a file that is opened later doesn't get its number.
void PrepareConsoleProcess();

} // namespace pmutil
