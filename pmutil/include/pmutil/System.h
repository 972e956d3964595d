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
// afresh and the lost one never turns up after it.
void DiscardUnwritten(std::FILE* stream);

// Makes the process independent of how it was started. Call it first in main, before any thread.
// - A crash raises no dialog and leaves no core dump. On Linux a hard core limit of 0 is beyond an
//   unprivileged process's reach: a crash reporter that core_pattern names still sees it then.
// - A write to a pipe whose reader has gone, or beyond the file-size limit, fails and doesn't end
//   the process; one to the terminal of another job succeeds and doesn't stop it.
// - On Windows an abort ends the process with the code 0xC0000409 in place of the status 3, an
//   unhandled exception does with its own, and no library comes from the current directory.
// - On Linux no signal is blocked, and those that tell of a crash or a child's end aren't ignored.
//   Others keep what they were given: SIGHUP stays ignored under nohup, SIGXCPU ends the process at
//   its CPU limit, SIGTTIN and SIGTSTP stop it as the user's shell means them to.
// - A standard stream that is closed stays one that fails: no file opened later takes its place.
void PrepareConsoleProcess();

} // namespace pmutil
