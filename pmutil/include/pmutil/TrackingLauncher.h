// Wraps another launcher and records how its child ended. The record is kept where ConsoleApp gives
// up the launch, for example because another process holds the child's output open.
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

// For one launch. Any thread may call the operations other than Launch and Wait.
class TrackingLauncher : public Launcher {
public:
    // `onEnd` is called by Wait when the end is known; Wait throws what it throws. May be empty.
    explicit TrackingLauncher(boost::shared_ptr<Launcher> launcher,
                              std::function<void()> onEnd = {});

    LaunchResult Launch(const std::wstring& program, const std::deque<std::string>& args) override;
    WaitResult Wait(int* exitCode) override;

    // If the child is not started yet, it is killed as soon as it is.
    void Kill() override;

    bool HasLaunched() const;
    bool IsKilled() const; // Kill was called

    // Empty until the end is known.
    std::optional<ChildEnd> GetEnd() const;

    // Waits until the end is known or Wait has failed, up to `maxWaitSeconds` (infinity: without
    // limit). Returns false if the time ran out.
    bool AwaitEnd(double maxWaitSeconds) const;

    // The same, but returns false at once if Kill was or is called.
    bool AwaitEndOrKill(double maxWaitSeconds) const;

private:
    void NoteOver(const std::optional<ChildEnd>& end);
    bool Await(double maxWaitSeconds, bool orKill) const;

    const boost::shared_ptr<Launcher> fLauncher;
    const std::function<void()> fOnEnd;
    mutable boost::mutex fMutex;
    mutable boost::condition_variable fCond;
    bool fLaunched = false;
    bool fIsKilled = false;
    bool fOver = false;
    std::optional<ChildEnd> fEnd;
};

} // namespace pmutil
