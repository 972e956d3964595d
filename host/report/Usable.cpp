#include "report/Usable.h"

#include <algorithm>
#include <cstddef>
#include <optional>
#include <string_view>
#include <utility>
#include <vector>

#include <fmt/format.h>

#include "report/Activity.h"
#include "report/Bytes.h"
#include "report/LineForm.h"
#include "report/Software.h"
#include "report/Trials.h"

namespace assay_host {

namespace {

constexpr std::string_view kContextFailure = "ContextOffscreen exception caught and ignored.";

bool HasPart(std::string_view text, std::string_view part)
{
    return text.find(part) != std::string_view::npos;
}

bool EndsWith(std::string_view text, std::string_view end)
{
    return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

bool StartsWith(std::string_view text, std::string_view start)
{
    return text.substr(0, start.size()) == start;
}

enum class TrialEnd { kPassed, kFailed, kUnreadable };

// The result of one device's trials of the interface.
struct DeviceTrial {
    const DeviceAnswers* fDevice;
    TrialEnd fEnd = TrialEnd::kPassed;
    const char* fReason = nullptr; // of a failure
    std::string fText{};
};

class UsableJudge {
public:
    UsableJudge(DeviceKind kind, const Answers& answers, const RunOutcome& outcome)
        : fKind(kind), fAnswers(answers), fOutcome(outcome)
    {}

    Usable Judge() const
    {
        if (IsDone())
            return JudgeDevices();
        if (fOutcome.fVerdict == Verdict::kNeverStarted)
            return Unknown("never-started", "assay could not be started.");
        if (fOutcome.fVerdict == Verdict::kUsageError)
            return Unknown("usage-error", "assay rejected its command line.");
        if (fOutcome.fVerdict == Verdict::kInterrupted)
            return Unknown(
                "interrupted",
                fmt::format("The run was interrupted before {} was tried.", GetKindName(fKind)));
        if (HasPassed())
            return Unreadable();
        if (FindStop() != fKind)
            return Unknown("ended-before",
                           fmt::format("The run ended before {} was tried.", GetKindName(fKind)));
        return JudgeStop();
    }

private:
    const Answer& Get(const char* key) const
    {
        return *std::find_if(fAnswers.fReport.begin(), fAnswers.fReport.end(),
                             [key](const Answer& answer) { return answer.fKey == key; });
    }

    bool Is(const char* key, const char* value) const
    {
        const ReportLine* const line = Get(key).fLine;
        return line != nullptr && line->fValue == value;
    }

    // Whether the report has continued after the last line of this interface.
    bool IsDone() const
    {
        const Answer& count = Get(GetCountKey(fKind));
        return HasPassed() && (count.IsKnown() || count.fMissing == Missing::kNoOpenCL);
    }

    bool HasPassed() const
    {
        const std::string& next = fAnswers.fNext;
        if (next.empty())
            return Get("assayEnd").fLine != nullptr;
        if (fKind == DeviceKind::kOpenCL)
            return next == "assayEnd" && FindStop() != fKind;
        return (next == GetCountKey(DeviceKind::kOpenCL) && FindStop() != fKind) ||
               GetKeyKind(next) == DeviceKind::kOpenCL || next == "assayEnd";
    }

    static std::optional<DeviceKind> GetKeyKind(const std::string& key)
    {
        const auto word = GetDeviceTag(key);
        return word ? std::optional(ReadDeviceTag(*word)->fKind) : std::nullopt;
    }

    // Returns the interface that the child was using when the report stopped; nothing before the
    // first and after the last one.
    std::optional<DeviceKind> FindStop() const
    {
        constexpr DeviceKind kGL = DeviceKind::kOpenGL;
        constexpr DeviceKind kCL = DeviceKind::kOpenCL;
        // A device that failed a test is given back before anything else is done.
        constexpr std::string_view kTerminated = "Testing terminated for ";
        const std::size_t at = fOutcome.fLastLogLine.rfind(kTerminated);
        if (at != std::string::npos) {
            const auto tag = ReadDeviceTag(
                std::string_view(fOutcome.fLastLogLine).substr(at + kTerminated.size()));
            if (tag)
                return tag->fKind;
        }
        const std::string& next = fAnswers.fNext;
        if (const auto kind = GetKeyKind(next))
            return kind;
        if (next == GetCountKey(kCL))
            return kCL;
        const bool isOfGL = next == "QGFOGLInitialized" || next == "OGLContextCreated" ||
                            next == GetCountKey(kGL) || StartsWith(next, "gputag.");
        return isOfGL ? std::optional(kGL) : std::nullopt;
    }

    Usable JudgeStop() const
    {
        if (fOutcome.fExitStatus && fOutcome.fLostOutputBytes > 0)
            return Unreadable(); // the report went on
        const auto tag = GetDeviceTag(fAnswers.fNext);
        const std::string device(tag ? *tag : "");
        const std::string where = GetActivityText(fAnswers.fNext);
        switch (fOutcome.fVerdict) {
        case Verdict::kCrashed:
            return {Usability::kBroken, "crashed",
                    fmt::format("assay crashed in {}, while {}.", GetKindName(fKind), where),
                    device};
        case Verdict::kHung:
            return {Usability::kBroken, "hung",
                    fmt::format("assay hung in {}, while {}.", GetKindName(fKind), where), device};
        default:
            return {Usability::kBroken, "ended",
                    fmt::format("assay ended in {}, while {}.", GetKindName(fKind), where), device};
        }
    }

    Usable JudgeDevices() const
    {
        std::vector<DeviceTrial> trials;
        for (const DeviceAnswers& device : fAnswers.fDevices)
            if (device.fKind == fKind)
                trials.push_back(MakeTrial(device));
        if (trials.empty())
            return JudgeNoDevice();
        const DeviceTrial* software = nullptr;
        const DeviceTrial* failed = nullptr;
        bool isUnreadable = false;
        for (const DeviceTrial& trial : trials) {
            if (trial.fEnd == TrialEnd::kUnreadable) {
                isUnreadable = true;
                continue;
            }
            const bool isSoftware = !FindSoftwareText(*trial.fDevice).empty();
            const bool hasPassed = trial.fEnd == TrialEnd::kPassed;
            if (hasPassed && !isSoftware)
                return {Usability::kHardware, "trials-passed",
                        fmt::format("{} works on graphics hardware.", GetKindName(fKind)),
                        trial.fDevice->fTag};
            const DeviceTrial*& first = hasPassed ? software : failed;
            if (!first)
                first = &trial;
        }
        if (isUnreadable)
            return Unreadable();
        if (!software)
            return {Usability::kBroken, failed->fReason,
                    fmt::format("{} does not work: {}.", GetKindName(fKind), failed->fText),
                    failed->fDevice->fTag};
        return {Usability::kSoftware, failed ? "others-failed" : "only-software",
                fmt::format("{} works in software alone{}.", GetKindName(fKind),
                            failed ? ": " + failed->fDevice->fTag + " does not work" : ""),
                software->fDevice->fTag};
    }

    DeviceTrial MakeTrial(const DeviceAnswers& device) const
    {
        for (const Trial& trial : kTrials)
            if (device.GetValue(trial.fKey) == "0")
                return MakeFailure(device, trial.fCode, trial.fText, trial.fKey);
        // A test after the last trial only describes the device; its failure doesn't matter.
        const char* const last = fKind == DeviceKind::kOpenGL ? "GLFrameBufferOK" : "CLCompute";
        if (device.Find(last))
            return {&device, LacksATrial(device) ? TrialEnd::kUnreadable : TrialEnd::kPassed};
        if (fOutcome.fVerdict == Verdict::kComplete && fOutcome.fExitStatus)
            return {&device, TrialEnd::kUnreadable}; // the child says that no test failed
        const Answer* const failed = device.FindFailed();
        if (failed)
            return MakeFailure(device, "device-failed", "a test failed", failed->fKey);
        return MakeFailure(device, "no-trial", "its trials have no answer", last);
    }

    static bool LacksATrial(const DeviceAnswers& device)
    {
        return std::any_of(
            device.fAnswers.begin(), device.fAnswers.end(), [](const Answer& answer) {
                return answer.fMissing == Missing::kUnreadable && IsTrial(answer.fKey);
            });
    }

    Usable JudgeNoDevice() const
    {
        const char* const name = GetKindName(fKind);
        if (fKind == DeviceKind::kOpenCL) {
            if (Get(GetCountKey(fKind)).fMissing == Missing::kNoOpenCL)
                return {Usability::kAbsent,
                        "no-library",
                        "There is no OpenCL library that can be used.",
                        {}};
            return {Usability::kAbsent,
                    "no-device",
                    "There is an OpenCL library, but it has no graphics device.",
                    {}};
        }
        if (HasContextFailure())
            return {Usability::kBroken,
                    "context-failed",
                    "No OpenGL context could be created on any display device" +
                        GetCauseText("OGLContextCreated") + ".",
                    {}};
        if (Is("QGFOGLInitialized", "0") && !fOutcome.FindCause("QGFOGLInitialized").empty()) {
            const std::string cause = fOutcome.FindCause("QGFOGLInitialized");
            if (HasPart(cause, "can't be opened"))
                return {Usability::kAbsent, "no-library", "There is no OpenGL library.", {}};
            if (!HasPart(cause, "has no display device"))
                return {Usability::kBroken,
                        "library-failed",
                        fmt::format("The OpenGL library does not work: {}.", ShowBytes(cause)),
                        {}};
        }
        return {Usability::kAbsent, "no-device", fmt::format("{} has no device.", name), {}};
    }

    // A driver may have written to standard error too: before the line, or so much that it is lost.
    bool HasContextFailure() const
    {
        const auto& lines = fOutcome.fErrorLines;
        return std::any_of(lines.begin(), lines.end(),
                           [](std::string_view line) { return EndsWith(line, kContextFailure); }) ||
               (Is("QGFOGLInitialized", "1") && !fOutcome.FindCause("OGLContextCreated").empty());
    }

    // Returns ": CAUSE", or nothing.
    std::string GetCauseText(const std::string& key) const
    {
        const std::string cause = fOutcome.FindCause(key);
        return cause.empty() ? cause : ": " + ShowBytes(cause);
    }

    DeviceTrial MakeFailure(const DeviceAnswers& device, const char* reason, const char* text,
                            const std::string& key) const
    {
        return {&device, TrialEnd::kFailed, reason,
                fmt::format("{}: {}{}", device.fTag, text, GetCauseText(device.fTag + "." + key))};
    }

    Usable Unreadable() const
    {
        return Unknown("unreadable",
                       fmt::format("Lines of the report about {} are missing or garbled.",
                                   GetKindName(fKind)));
    }

    static Usable Unknown(const char* reason, std::string text)
    {
        return {Usability::kUnknown, reason, std::move(text), {}};
    }

    const DeviceKind fKind;
    const Answers& fAnswers;
    const RunOutcome& fOutcome;
};

} // namespace

const char* GetUsabilityName(Usability usability)
{
    switch (usability) {
    case Usability::kHardware:
        return "hardware";
    case Usability::kSoftware:
        return "software";
    case Usability::kBroken:
        return "broken";
    case Usability::kAbsent:
        return "absent";
    case Usability::kUnknown:
        break;
    }
    return "unknown";
}

int GetUsabilityStatus(Usability usability)
{
    constexpr int kFirstOther = 20;
    return usability == Usability::kHardware ? 0 : kFirstOther + static_cast<int>(usability) - 1;
}

Usability GetLesser(Usability first, Usability second)
{
    for (const Usability less :
         {Usability::kBroken, Usability::kAbsent, Usability::kUnknown, Usability::kSoftware})
        if (first == less || second == less)
            return less;
    return Usability::kHardware;
}

Usable JudgeUsable(DeviceKind kind, const Answers& answers, const RunOutcome& outcome)
{
    return UsableJudge(kind, answers, outcome).Judge();
}

} // namespace assay_host
