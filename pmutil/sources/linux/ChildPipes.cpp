#include "linux/ChildPipes.h"

#include <cerrno>
#include <fcntl.h>
#include <unistd.h>

#include <boost/make_shared.hpp>

#include "all/BinioLog.h"
#include "linux/CallFailure.h"

namespace pmutil {

namespace {

boost::shared_ptr<PosixHandle> MakeClosed()
{
    return boost::make_shared<PosixHandle>(PosixCalls::GetInvalid(), false);
}

// In a host whose standard streams are closed, the pipe may get their numbers, which the child's
// streams would overwrite.
void MoveUp(PosixHandle& end)
{
    if (end.GetHandle() >= kMinOtherDescriptor)
        return;
    const int moved = ::fcntl(end.GetHandle(), F_DUPFD_CLOEXEC, kMinOtherDescriptor);
    if (moved < 0)
        throw CallFailure{"fcntl", errno};
    end.Reset(moved, true);
}

} // namespace

ChildPipe::ChildPipe(const char* stream, int bytes) : reader(MakeClosed()), writer(MakeClosed())
{
    int ends[2];
    if (::pipe2(ends, O_CLOEXEC) != 0)
        throw CallFailure{"pipe2", errno};
    reader->Reset(ends[0], true);
    writer->Reset(ends[1], true);
    MoveUp(*reader);
    MoveUp(*writer);
    if (bytes > 0)
        ::fcntl(writer->GetHandle(), F_SETPIPE_SZ, bytes); // optional: ignore a failure
    PM_LOG(gBinioLog, "child" << stream << "Rd=" << reader->GetHandle() << " child" << stream
                              << "Wr=" << writer->GetHandle());
}

void ChildPipes::CloseChildEnds() const
{
    for (const auto& end : {fInput.reader, fOutput.writer, fError.writer})
        end->Close();
}

LaunchResult ChildPipes::GetHostEnds() const
{
    LaunchResult result;
    result.fAppInput = fInput.writer;
    result.fAppOutput[static_cast<int>(OutputChannel::kStdout)] = fOutput.reader;
    result.fAppOutput[static_cast<int>(OutputChannel::kStderr)] = fError.reader;
    return result;
}

} // namespace pmutil
