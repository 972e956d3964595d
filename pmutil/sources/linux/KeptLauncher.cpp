#include "pmutil/KeptLauncher.h"

#include <csignal>
#include <unistd.h>

#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>

#include "linux/CallFailure.h"
#include "linux/ChildPipes.h"
#include "linux/ChildWords.h"
#include "linux/KeeperProcess.h"

namespace pmutil {

KeptLauncher::KeptLauncher() = default;
KeptLauncher::~KeptLauncher() = default;

boost::shared_ptr<KeeperProcess> KeptLauncher::GetKeeper() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fKeeper;
}

LaunchResult KeptLauncher::Launch(const std::wstring& program, const std::deque<std::string>& args)
{
    const std::string path = GetPathInUTF8(program, "execve");
    try {
        const ChildWords words(path, args, "execve");
        const ChildPipes pipes;
        const auto keeper = boost::make_shared<KeeperProcess>();
        KeeperPlan plan = {};
        plan.fProgram = path.c_str();
        plan.fArgs = words.Get();
        plan.fEnvironment = ::environ;
        plan.fStreams[0] = pipes.fInput.reader->GetHandle();
        plan.fStreams[1] = pipes.fOutput.writer->GetHandle();
        plan.fStreams[2] = pipes.fError.writer->GetHandle();
        keeper->Start(plan);
        pipes.CloseChildEnds();
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fKeeper = keeper;
        return pipes.GetHostEnds();
    } catch (const CallFailure& failure) {
        ThrowFailed(failure, path);
    }
}

WaitResult KeptLauncher::Wait(int* exitCode)
{
    const boost::shared_ptr<KeeperProcess> keeper = GetKeeper();
    if (keeper == nullptr)
        ThrowFailed({"waitid", ECHILD});
    // The child gets SIGKILL when its keeper is killed.
    const KeeperEnd end = keeper->Await().value_or(KeeperEnd{CLD_KILLED, SIGKILL});
    if (end.fCode == CLD_EXITED) {
        *exitCode = end.fStatus;
        return kEndedNormally;
    }
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fTermSignal = end.fStatus;
    return fKilled ? kEndedByKill : kEndedByCrash;
}

void KeptLauncher::Kill()
{
    boost::shared_ptr<KeeperProcess> keeper;
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fKilled = true;
        keeper = fKeeper;
    }
    if (keeper != nullptr)
        keeper->Kill();
}

bool KeptLauncher::EndAll(double seconds)
{
    const boost::shared_ptr<KeeperProcess> keeper = GetKeeper();
    return keeper == nullptr || keeper->EndAll(seconds);
}

void KeptLauncher::Leave()
{
    const boost::shared_ptr<KeeperProcess> keeper = GetKeeper();
    if (keeper != nullptr)
        keeper->Leave();
}

int KeptLauncher::GetTermSignal() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fTermSignal;
}

} // namespace pmutil
