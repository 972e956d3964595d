// The processes of one run: starts the child, and ends its descendants.
#pragma once

#include <memory>

#include <boost/shared_ptr.hpp>

#include "pmutil/Launcher.h"

namespace assay_host {

// For one run. One thread at a time, except as GetLauncher() says.
class Containment {
public:
    Containment() = default;
    virtual ~Containment() = default;
    Containment(const Containment&) = delete;
    Containment& operator=(const Containment&) = delete;

    // Returns the launcher of the child. The threads of the launch use it, and may outlive this
    // object.
    virtual boost::shared_ptr<pmutil::Launcher> GetLauncher() = 0;

    // Kills the child and all its descendants. Returns false if some are left after this time, by
    // the system's clock, or if the system doesn't report them.
    virtual bool EndAll(double seconds) = 0;
};

// Makes one for a program that starts no other children: all descendants of this process that were
// started since then are the child's. One at a time in a process; make it while no launch is in
// progress. On Linux this process adopts orphaned descendants.
std::unique_ptr<Containment> MakeOwnContainment();

// The same with another launcher.
std::unique_ptr<Containment> MakeOwnContainment(boost::shared_ptr<pmutil::Launcher> launcher);

// Makes one for a library in any host: any number at a time, and no process of the host is touched.
// If the host ends, even if it is killed, the child and its descendants are killed.
std::unique_ptr<Containment> MakeForeignContainment();

} // namespace assay_host
