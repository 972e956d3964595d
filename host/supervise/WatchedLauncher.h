// Another launcher, with a record of how its child ended. What a launch tells of that is lost when
// the launch itself has to be given up.
#pragma once

#include <optional>

#include <boost/shared_ptr.hpp>
#include <boost/thread/mutex.hpp>

#include "pmutil/Launcher.h"
#include "supervise/EventQueue.h"

namespace assay_host {

struct ChildEnd {
    pmutil::WaitResult fResult = pmutil::kEndedNormally;
    int fExitCode = 0;
};

// For one launch.
class WatchedLauncher : public pmutil::Launcher {
public:
    WatchedLauncher(boost::shared_ptr<pmutil::Launcher> launcher,
                    boost::shared_ptr<EventQueue> queue);

    pmutil::LaunchResult Launch(const std::wstring& program,
                                const std::deque<std::string>& args) override;
    pmutil::WaitResult Wait(int* exitCode) override;
    void Kill() override;

    // Any thread may ask.
    bool HasLaunched() const;
    std::optional<ChildEnd> GetEnd() const;

private:
    const boost::shared_ptr<pmutil::Launcher> fLauncher;
    const boost::shared_ptr<EventQueue> fQueue;
    mutable boost::mutex fMutex;
    bool fLaunched = false;
    std::optional<ChildEnd> fEnd;
};

} // namespace assay_host
