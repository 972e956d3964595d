// The three pipes of a new child.
#pragma once

#include <boost/shared_ptr.hpp>

#include "pmutil/Launcher.h"
#include "pmutil/PosixHandle.h"

namespace pmutil {

// The first descriptor after the standard streams.
constexpr int kMinOtherDescriptor = 3;

// A pipe with one end for the host and one for the child. Neither is a standard stream, and both
// have close-on-exec set.
struct ChildPipe {
    // Logs the ends as those of this stream. A size of 0 bytes is the usual one. Throws
    // CallFailure.
    explicit ChildPipe(const char* stream, int bytes = 0);

    boost::shared_ptr<PosixHandle> reader;
    boost::shared_ptr<PosixHandle> writer;
};

struct ChildPipes {
    ChildPipes() = default; // throws CallFailure

    void CloseChildEnds() const;
    LaunchResult GetHostEnds() const;

    // For children that write much: the default of /proc/sys/fs/pipe-max-size. The other pipes keep
    // the usual size, because there is a limit for all pipes of a user.
    static constexpr int kOutputPipeBytes = 1 << 20;

    ChildPipe fInput{"Stdin"};
    ChildPipe fOutput{"Stdout", kOutputPipeBytes};
    ChildPipe fError{"Stderr"};
};

} // namespace pmutil
