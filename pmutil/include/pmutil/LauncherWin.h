// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Launches, waits for and kills children with CreateProcessW.
//
// The child inherits its three pipes and no other handle.
//
// A child that ends with a code of 256 or more crashed, or was killed if Kill was called.
//
// Each argument is enclosed in double quotation marks, or in apostrophes if it has a double
// quotation mark and no apostrophe; the same quote inside is escaped by a backslash. The usual C
// runtime of a child doesn't support apostrophes, and treats backslashes before a quotation mark as
// escapes. Therefore the child gets a different argument if it has quotation marks or ends with a
// backslash.
#pragma once

#include <cstdint>
#include <memory>

#include <boost/thread/mutex.hpp>

#include "pmutil/Launcher.h"

struct _PROCESS_INFORMATION;

namespace pmutil {

class LauncherWin : public Launcher {
public:
    LauncherWin();

    // With a job, each child is a member of it from its first instruction on, and its handles are
    // closed by the next Launch and the destructor. From Windows 10 on it is created in the job, so
    // that one whose launcher is killed at any time ends with the job. The job must exist until
    // Launch has returned. Null: no job.
    explicit LauncherWin(void* job);
    ~LauncherWin() override;

    // Begins the command line with `program` unchanged: the caller must quote a path with blanks.
    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override;
    WaitResult Wait(int* exitCode) override;
    void Kill() override;

    // Returns the code with which the latest child ended, also after a crash or a kill; 0 before
    // Wait has returned.
    std::uint32_t GetRawExitCode() const;

    // Returns the command line that Launch uses.
    static std::wstring MakeCommandLine(const std::wstring& program,
                                        const std::deque<std::string>& args);

private:
    void* GetProcess() const; // its handle; null if no child was started
    void EnterJob(const ::_PROCESS_INFORMATION& child) const;
    void CloseJobMember();

    void* const fJob;
    mutable boost::mutex fMutex; // guards all below
    bool fKilled = false;
    // Of the latest child; zero before the first one. Without a job its handles are never
    // closed, so that Kill is valid at any time.
    const std::unique_ptr<::_PROCESS_INFORMATION> fProcessInfo;
    std::uint32_t fRawExitCode = 0;
};

} // namespace pmutil
