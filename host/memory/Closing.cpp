#include "memory/Closing.h"

#include <algorithm>
#include <array>
#include <optional>
#include <string>
#include <string_view>

#include <fmt/format.h>

#include "report/Answers.h"
#include "report/Bytes.h"

namespace assay_host {

namespace {

// Longer texts of a driver are cut: the file is small.
constexpr std::size_t kMaxText = 1000;

// The starts of terminations that are requests of other processes or of the system: SIGHUP, SIGINT,
// SIGQUIT, SIGKILL and SIGTERM, and on Windows Ctrl-C, the end of the session, and a start during
// that end.
constexpr std::array<std::string_view, 8> kOrders = {
    "signal 1 ",  "signal 2 ",       "signal 3 ",       "signal 9 ",
    "signal 15 ", "code 0xC000013A", "code 0x40010004", "code 0xC0000142"};

std::string Cut(std::string text)
{
    if (text.size() > kMaxText)
        text.resize(kMaxText);
    return text;
}

// Returns the value of a device's key; empty if it isn't known.
std::string GetKnown(const DeviceAnswers& device, std::string_view key)
{
    for (const Answer& answer : device.fAnswers)
        if (answer.fKey == key && answer.IsKnown())
            return Cut(answer.fLine->fValue);
    return {};
}

bool IsOrder(const std::string& termination)
{
    return std::any_of(kOrders.begin(), kOrders.end(), [&](std::string_view order) {
        return termination.compare(0, order.size(), order) == 0;
    });
}

AttemptEnd GetEnd(const RunOutcome& outcome)
{
    switch (outcome.fVerdict) {
    case Verdict::kNeverStarted:
        return AttemptEnd::kNotStarted;
    case Verdict::kInterrupted:
        return AttemptEnd::kStopped;
    case Verdict::kHung:
        return AttemptEnd::kHung;
    case Verdict::kCrashed:
        return IsOrder(outcome.fTermination) ? AttemptEnd::kKilled : AttemptEnd::kCrashed;
    case Verdict::kComplete:
    case Verdict::kFailedTests:
    case Verdict::kUsageError:
        break;
    }
    // With -exit=N a crash code can be the requested status of a whole report.
    return AttemptEnd::kEnded;
}

Finding MakeFinding(DeviceKind kind, const Answers& answers, const RunOutcome& outcome,
                    AttemptEnd end)
{
    const Usable usable = JudgeUsable(kind, answers, outcome);
    Finding finding;
    if (end == AttemptEnd::kKilled && (std::string_view(usable.fReason) == "crashed" ||
                                       std::string_view(usable.fReason) == "ended-before")) {
        finding.fReason = "killed";
        finding.fText =
            fmt::format("Another process killed the child while {} was tried.", GetKindName(kind));
        return finding;
    }
    finding.fUsability = usable.fUsability;
    finding.fReason = usable.fReason;
    finding.fText = Cut(usable.fText);
    finding.fTag = usable.fTag;
    const auto device =
        std::find_if(answers.fDevices.begin(), answers.fDevices.end(),
                     [&](const DeviceAnswers& each) { return each.fTag == usable.fTag; });
    if (device == answers.fDevices.end())
        return finding;
    const bool isGL = kind == DeviceKind::kOpenGL;
    finding.fDevice = GetKnown(*device, isGL ? "GLName" : "CLName");
    if (finding.fDevice.empty() && isGL)
        finding.fDevice = GetKnown(*device, "GLRenderer");
    finding.fDriver = GetKnown(*device, isGL ? "GLDriverVersion" : "CLDriverVersion");
    return finding;
}

} // namespace

void CloseAttempt(Attempt& attempt, const Report& report, const RunOutcome& outcome,
                  std::int64_t now)
{
    attempt.fEnded = now;
    attempt.fEnd = GetEnd(outcome);
    attempt.fExitStatus = outcome.fExitStatus;
    attempt.fTermination = outcome.fTermination;
    attempt.fReason = Cut(ShowBytes(outcome.fReason));
    attempt.fLastLine =
        Cut(outcome.fLastLogLine.empty() ? outcome.fLastReportLine : outcome.fLastLogLine);
    const Answers answers = GetAnswers(report);
    attempt.fOpenGL = MakeFinding(DeviceKind::kOpenGL, answers, outcome, attempt.fEnd);
    attempt.fOpenCL = MakeFinding(DeviceKind::kOpenCL, answers, outcome, attempt.fEnd);
}

OpenState SettleOpen(std::vector<Attempt>& attempts, Machine& machine)
{
    OpenState state = OpenState::kNone;
    std::optional<HostMark> self; // most calls find no open attempt, and don't need it
    for (Attempt& attempt : attempts) {
        if (attempt.fEnd != AttemptEnd::kOpen)
            continue;
        if (!self)
            self = machine.GetSelf();
        const HostMark& host = attempt.fHost;
        const bool isHere = host.fMachine == self->fMachine;
        const bool isKnown = isHere && !host.fBoot.empty() && !self->fBoot.empty();
        const bool isSameBoot = isKnown && machine.IsSameBoot(host.fBoot, self->fBoot);
        if (isSameBoot && machine.IsAlive(host))
            return OpenState::kAlive;
        const bool isFreeze = isKnown && !isSameBoot;
        attempt.fEnd = isFreeze ? AttemptEnd::kSystemEnded : AttemptEnd::kHostEnded;
        attempt.fReason = isFreeze ? "The system ended during the attempt."
                                   : "The host ended during the attempt.";
        state = OpenState::kSettled;
    }
    return state;
}

} // namespace assay_host
