// Starts, awaits and kills children by CreateProcessW.
//
// The child inherits its three pipes and no other handle, inheritable or not.
//
// A child that ends with a code of 256 or more crashed, or was killed if Kill was called.
//
// Each argument is put in double quotation marks, or in apostrophes if it holds a double quotation
// mark and no apostrophe; the quote inside gets a backslash. The usual C runtime, in the child,
// knows nothing of apostrophes and takes backslashes before a quotation mark for its own, so that
// an argument with quotation marks, or with a backslash at its end, arrives changed.
#pragma once

#include <atomic>
#include <cstdint>

#include "pmutil/Launcher.h"

namespace pmutil {

class LauncherWin : public Launcher {
public:
    LauncherWin();
    ~LauncherWin() override;

    // `program` goes first on the command line as it stands: one with blanks must come quoted.
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override;
    WaitResult Wait(int* exitCode) override;
    void Kill() override;

    // The code with which the latest child ended, whatever it says; 0 before it was waited for.
    std::uint32_t GetRawExitCode() const { return fRawExitCode; }

    // The command line that Launch makes.
    static std::wstring MakeCommandLine(const std::wstring& program,
                                        const std::deque<std::string>& args);

private:
    std::atomic<bool> fKilled{false};
    std::atomic<void*> fProcess{nullptr};
    std::atomic<std::uint32_t> fRawExitCode{0};
};

} // namespace pmutil
