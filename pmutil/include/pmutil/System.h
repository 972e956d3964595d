// What the library asks of the machine and the process. One twin source per platform implements
// it; everything that decides anything stands elsewhere.
#pragma once

#include <cstdint>
#include <cstdio>
#include <string>

namespace pmutil {

// Universal time in seconds, with the system clock's own resolution, since 1970-01-01. Any thread.
double GetClockSeconds();

// The operating system's numeric id of the calling thread.
std::uint64_t GetCurrentThreadNumber();

// Shows a thread's name to an attached debugger or to the system's tools; does nothing where the
// platform has no such thing.
void ShowThreadName(const std::string& name);

// Total physical memory in bytes. Throws std::runtime_error "GlobalMemoryStatusEx failed" if the
// system doesn't say.
std::uint64_t GetPhysicalMemoryBytes();

// The user's desktop folder, empty if it can't be found. On Linux: XDG_DESKTOP_DIR of the user's
// user-dirs file, else "Desktop" in the home folder that the password database names.
std::wstring GetDesktopFolder();

// The process's current directory. Throws std::runtime_error "GetCurrentDirectoryW failed".
std::wstring GetCurrentDirectoryPath();

// Opens a file for appending so that other processes may read it while it grows; null on failure.
std::FILE* OpenSharedAppend(const std::string& path);

// Throws away what `stream` holds unwritten after a failed write, so that a later line is tried
// afresh and the lost one never turns up behind it.
void DiscardUnwritten(std::FILE* stream);

// Keeps a crash of this process from raising a dialog or leaving a core dump, and a write to a pipe
// whose reader has gone from ending it. A standard stream that is closed stays one that fails: no
// file opened later takes its place. Call it first in main.
void PrepareConsoleProcess();

} // namespace pmutil
