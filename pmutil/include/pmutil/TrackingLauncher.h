// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Wraps another launcher and records how its child ended. The record remains if ConsoleApp gives up
// the launch, for example because another process holds the child's output open.
#pragma once

#include <functional>
#include <optional>
#include <string>

#include <boost/shared_ptr.hpp>
#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/Launcher.h"

namespace pmutil {

struct ChildEnd {
    WaitResult fResult = kEndedNormally;
    int fExitCode = 0;            // 0 to 255; 0 unless kEndedNormally
    std::string fTerminationText; // GetTerminationText of the wrapped launcher
};

// For one launch. Any thread may call the functions other than Launch and Wait.
class TrackingLauncher : public Launcher {
public:
    // Wait calls `onEnd` when the end is known, and passes on its exceptions. May be empty.
    explicit TrackingLauncher(boost::shared_ptr<Launcher> launcher,
                              std::function<void()> onEnd = {});

    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override;
    WaitResult Wait(int* exitCode) override;

    // Kills a child that is not started yet as soon as it is started.
    void Kill() override;

    bool HasLaunched() const;
    bool IsKilled() const; // Kill was called

    // Returns nullopt until the end is known.
    std::optional<ChildEnd> GetEnd() const;

    // Waits until the end is known or Wait has failed, up to `maxWaitSeconds` (infinity: without a
    // limit). Returns false on timeout.
    bool AwaitEnd(double maxWaitSeconds) const;

    // The same, but returns false at once if Kill was or is called.
    bool AwaitEndOrKill(double maxWaitSeconds) const;

private:
    void SetOver(const std::optional<ChildEnd>& end);
    bool Await(double maxWaitSeconds, bool orKill) const;

    const boost::shared_ptr<Launcher> fLauncher;
    const std::function<void()> fOnEnd;
    mutable boost::mutex fMutex;
    mutable boost::condition_variable fCond;
    bool fLaunched = false;
    bool fIsKilled = false;
    bool fOver = false; // Wait has returned or failed
    std::optional<ChildEnd> fEnd;
};

} // namespace pmutil
