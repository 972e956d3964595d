#include "supervise/ChildRun.h"

#include <algorithm>
#include <chrono>
#include <utility>

#include <boost/filesystem/operations.hpp>
#include <boost/make_shared.hpp>

#include "pmutil/ChildCommand.h"
#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/OutputPump.h"
#include "pmutil/StartAwareApp.h"
#include "report/LineForm.h"
#include "report/LogFilter.h"
#include "report/RunLog.h"
#include "supervise/ErrorLines.h"
#include "supervise/EventQueue.h"
#include "supervise/Judge.h"
#include "supervise/Paths.h"
#include "supervise/StreamFeed.h"
#include "supervise/ThreadSignals.h"

namespace assay_host {

namespace {

using Clock = RunTimes::Clock;
using Seconds = RunTimes::Seconds;
using std::chrono::milliseconds;

// The part of the child's output that is parsed. It bounds the processor time; fLimits bounds the
// memory: an added log and the rests of cut lines aren't kept.
constexpr std::uint64_t kMaxOutputBytes = std::uint64_t{64} << 20;

boost::shared_ptr<pmutil::OutputTask> MakePump(const boost::shared_ptr<StreamFeed>& feed)
{
    return boost::make_shared<pmutil::OutputPump>(
        [feed](std::string_view block) { feed->Take(block); });
}

bool HasVerbosity(const std::vector<std::string>& args)
{
    constexpr char kOption[] = "-verbose=";
    return std::any_of(args.begin(), args.end(),
                       [&](const std::string& arg) { return arg.rfind(kOption, 0) == 0; });
}

class Supervision {
public:
    Supervision(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop,
                Containment& containment, const RunTimes& times)
        : fTimes(times),
          fOptions(options),
          fObserver(observer),
          fStop(stop),
          fContainment(containment),
          fLauncher(boost::make_shared<pmutil::TrackingLauncher>(
              containment.GetLauncher(),
              [queue = fQueue] {
                  queue->Push({Event::Kind::kChildEnd, {}, {}});
              })),
          fReader(options.fLimits)
    {
        fOutcome.fCommand.push_back(options.fProgram);
        fOutcome.fCommand.insert(fOutcome.fCommand.end(), options.fArgs.begin(),
                                 options.fArgs.end());
        fOutcome.fTimeoutSeconds = options.fTimeoutSeconds;
    }

    Supervision(const Supervision&) = delete;
    Supervision& operator=(const Supervision&) = delete;

    RunOutcome Run()
    {
        if (fStop.IsRaised()) {
            fEvidence.fKillReason = KillReason::kInterrupt;
        } else if (Launch()) {
            fOutcome.fDrivers.fReason = fOptions.fKeepCauses
                                            ? "the child did not log them"
                                            : "the log of the child was not requested";
            try {
                fObserver.OnStart();
                Follow();
                Finish();
            } catch (...) {
                KillDirectly();
                fQueue->Close();
                throw;
            }
        }
        fOutcome.fLeftBehind = fLeftBehind;
        Judge(fEvidence, fOutcome);
        return std::move(fOutcome);
    }

private:
    bool Launch()
    {
        fLaunch.SetConsoleApp(boost::make_shared<pmutil::StartAwareApp>(fLauncher));
        try {
            const pmutil::ChildCommand command =
                pmutil::MakeChildCommand(fOptions.fProgram, GetArgs());
            fLaunch.SetLaunchParams(pmutil::LaunchParams(MakePump(fOut), MakePump(fErr),
                                                         command.fArgs, command.fProgram));
            const SignalBlock block;
            fLaunch.Launch();
        } catch (const std::exception& exc) {
            NoteStartFailure(exc.what());
            if (fLauncher->HasLaunched())
                KillDirectly(); // the launch failed after the child's start
            fQueue->Close();    // an output may be read already
            fLeftBehind = !fContainment.EndAll(fTimes.fTreeSeconds);
            return false;
        }
        return true;
    }

    void NoteStartFailure(const std::string& text)
    {
        fOutcome.fSeconds = GetSeconds();
        boost::system::error_code error;
        const boost::filesystem::file_status status =
            boost::filesystem::status(ToPath(fOptions.fProgram), error);
        if (fOptions.fProgram.empty() || status.type() == boost::filesystem::file_not_found)
            fEvidence.fStartFailure = "there is no file " + fOptions.fProgram;
        else if (status.type() == boost::filesystem::directory_file)
            fEvidence.fStartFailure = fOptions.fProgram + " is a directory";
        else
            fEvidence.fStartFailure = text;
    }

    // Handles events until the child and its output have ended, or were abandoned.
    void Follow()
    {
        while (fEvidence.fStartFailure.empty() && !IsOver()) {
            const Clock::time_point before = fTimes.fNow();
            const milliseconds patience = GetPatience();
            const std::optional<Event> event = fQueue->Pop(patience);
            if (fEnded)
                fIdle += std::min<Seconds>(fTimes.fNow() - before, patience);
            if (event)
                Take(*event);
            if (fKilled)
                fKillWait += std::min<Seconds>(fTimes.fNow() - before, fTimes.fTick);
            Tick();
        }
    }

    bool IsOver()
    {
        if (fEnded && fOpenStreams == 0)
            return true;
        if (!fEnded)
            return fKilled && fKillWait >= fTimes.fKillGrace;
        if (fTreeEnded)
            return fIdle >= fTimes.fLastStreamGrace + fTimes.fStreamGrace;
        if (fKilled || fIdle >= fTimes.fStreamGrace) {
            fTreeEnded = true;
            fLeftBehind = !fContainment.EndAll(fTimes.fTreeSeconds);
        }
        return false;
    }

    // Returns how long to wait for the next event: until the next limit or tick.
    milliseconds GetPatience() const
    {
        Seconds patience = fTimes.fTick;
        if (fEnded)
            patience = std::min<Seconds>(patience, fTimes.fStreamGrace / 4);
        else if (!fKilled && fOptions.fTimeoutSeconds > 0)
            patience = std::min(patience, Seconds(fOptions.fTimeoutSeconds - GetSeconds()));
        return std::max(milliseconds(1), std::chrono::duration_cast<milliseconds>(patience));
    }

    void Take(const Event& event)
    {
        switch (event.fKind) {
        case Event::Kind::kChildEnd:
            fEnded = true;
            fOutcome.fSeconds = GetSeconds();
            break;
        case Event::Kind::kStreamEnd:
            --fOpenStreams;
            break;
        case Event::Kind::kBytes:
            if (event.fChannel == pmutil::OutputChannel::kStdout)
                TakeOutput(event.fBytes);
            else
                TakeErrorLines(fErrorLines.Feed(event.fBytes));
        }
    }

    // Put the option first, so that a later -verbose= of the arguments would replace it.
    std::vector<std::string> GetArgs() const
    {
        std::vector<std::string> args = fOptions.fArgs;
        if (fAddsLog)
            args.insert(args.begin(), "-verbose=0x101"); // 0x100: the files that drivers load
        return args;
    }

    void TakeOutput(const std::string& bytes)
    {
        if (fAddsLog)
            TakePieces(fLog.Feed(bytes));
        else
            TakeLines(fReader.Feed(bytes));
    }

    void TakePieces(const std::vector<LogFilter::Piece>& pieces)
    {
        for (const LogFilter::Piece& piece : pieces)
            if (piece.fIsLog)
                TakeLogLine(piece.fText);
            else
                TakeLines(fReader.Feed(piece.fText));
    }

    void TakeLogLine(const std::string& text)
    {
        fObserver.OnLogLine(text, GetSeconds());
        // A list of files doesn't name the call that comes next.
        if (!ReadLogText(text))
            fEvidence.fReport.Add(ReadLine(text, "\n", false));
    }

    bool ReadLogText(const std::string& line)
    {
        return fRunLog.Add(GetLogText(line), fEvidence.fReport.GetSequence(), fOutcome);
    }

    void TakeLines(const std::vector<ReportLine>& lines)
    {
        for (const ReportLine& line : lines) {
            // The arguments may request a log, which is then a part of the report.
            if (fOptions.fKeepCauses && line.fKind == LineKind::kComment && IsLogLine(line.fText))
                ReadLogText(line.fText);
            fEvidence.fReport.Add(line);
            fObserver.OnLine(line, GetSeconds());
        }
    }

    void TakeErrorLines(std::vector<std::string> lines)
    {
        for (std::string& line : lines) {
            fObserver.OnErrorLine(line, GetSeconds());
            fOutcome.fErrorLines.push_back(std::move(line));
        }
    }

    void Tick()
    {
        const Clock::time_point now = fTimes.fNow();
        if (now - fLastTick >= fTimes.fTick) {
            fLastTick = now;
            fObserver.OnTick(GetSeconds());
            if (!fKilled && !fEnded)
                LookForFailure();
        }
        if (fKilled || fEnded)
            return;
        if (fStop.IsRaised())
            Kill(KillReason::kInterrupt);
        else if (fOptions.fTimeoutSeconds > 0 && GetSeconds() >= fOptions.fTimeoutSeconds)
            Kill(KillReason::kTimeout);
    }

    // A failure of the launcher's thread ends the launch, and pmutil has then killed the child.
    // This doesn't hold after the child's end, whose event may still be in the queue. A failure of
    // a pump only ends its stream.
    void LookForFailure()
    {
        try {
            fLaunch.ThrowIfFailurePending();
        } catch (const pmutil::consoleapp::Exception& exc) {
            if (exc.GetTaskID() == pmutil::TaskID::kLauncher && !fLauncher->GetEnd())
                NoteStartFailure(exc.what());
        }
    }

    void Kill(KillReason reason)
    {
        fKilled = true;
        fEvidence.fKillReason = reason;
        try {
            fLaunch.Kill();
        } catch (const std::exception&) {
            // Kill threw a stored failure of the launch, and the child is still alive.
            KillDirectly();
        }
    }

    void KillDirectly()
    {
        try {
            fLauncher->Kill();
        } catch (const std::exception&) {
            // The child is then reported as left behind.
        }
    }

    void Finish()
    {
        if (fEvidence.fKillReason == KillReason::kNone && fStop.IsRaised())
            fEvidence.fKillReason = KillReason::kInterrupt; // it reached the child first
        while (const std::optional<Event> event = fQueue->Pop(milliseconds(0)))
            Take(*event);
        fQueue->Close();
        if (fAddsLog)
            TakePieces(fLog.Finish());
        TakeLines(fReader.Finish());
        TakeErrorLines(fErrorLines.Finish());
        fRunLog.Finish(fOutcome);
        if (!fEnded)
            fOutcome.fSeconds = GetSeconds();
        try {
            int exitCode = 0;
            fLaunch.Wait(&exitCode, fEnded ? fTimes.fJoinSeconds : 0.0);
        } catch (const std::exception&) {
            // The launcher has recorded how the child ended.
        }
        fEvidence.fEnd = fLauncher->GetEnd();
        if (!fTreeEnded)
            fLeftBehind = !fContainment.EndAll(fTimes.fTreeSeconds);
        fLeftBehind = fLeftBehind || (!fEnded && fEvidence.fStartFailure.empty()) ||
                      (fEnded && fOpenStreams > 0);
        fOutcome.fLostOutputBytes = fReader.GetLostByteCount() + fOut->GetDroppedByteCount();
        fOutcome.fLostErrorBytes = fErrorLines.GetLostByteCount() + fErr->GetDroppedByteCount();
    }

    double GetSeconds() const { return Seconds(fTimes.fNow() - fStart).count(); }

    const RunTimes fTimes;
    const ChildOptions& fOptions;
    RunObserver& fObserver;
    pmutil::StopRequest& fStop;
    const boost::shared_ptr<EventQueue> fQueue = boost::make_shared<EventQueue>();
    Containment& fContainment;
    const boost::shared_ptr<pmutil::TrackingLauncher> fLauncher;
    const boost::shared_ptr<StreamFeed> fOut =
        boost::make_shared<StreamFeed>(pmutil::OutputChannel::kStdout, fQueue, kMaxOutputBytes);
    const boost::shared_ptr<StreamFeed> fErr = boost::make_shared<StreamFeed>(
        pmutil::OutputChannel::kStderr, fQueue, ErrorLines::kMaxBytes);
    const pmutil::StopListener fListener{fStop, [queue = fQueue] { queue->Wake(); }};
    pmutil::ConsoleAppLauncher fLaunch;

    const bool fAddsLog = fOptions.fKeepCauses && !HasVerbosity(fOptions.fArgs);
    LogFilter fLog;
    RunLog fRunLog;
    ReportReader fReader;
    ErrorLines fErrorLines;
    Evidence fEvidence;
    RunOutcome fOutcome;

    const Clock::time_point fStart = fTimes.fNow();
    Clock::time_point fLastTick = fStart;
    // Waiting times. While this process is stopped they don't grow: the threads that would end the
    // waits are stopped too.
    Seconds fKillWait{0}; // for the child's end since the kill
    Seconds fIdle{0};     // for output since the child's end
    bool fKilled = false;
    bool fEnded = false;
    bool fTreeEnded = false;
    bool fLeftBehind = false;
    int fOpenStreams = 2;
};

} // namespace

RunOutcome RunChild(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop,
                    Containment& containment, const RunTimes& times)
{
    return Supervision(options, observer, stop, containment, times).Run();
}

RunOutcome RunChild(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop)
{
    return RunChild(options, observer, stop, *MakeOwnContainment(), DefaultRunTimes());
}

RunOutcome RunChild(const ChildOptions& options, RunObserver& observer, pmutil::StopRequest& stop,
                    const boost::shared_ptr<pmutil::Launcher>& launcher, const RunTimes& times)
{
    return RunChild(options, observer, stop, *MakeOwnContainment(launcher), times);
}

} // namespace assay_host
