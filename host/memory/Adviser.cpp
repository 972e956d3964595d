#include "memory/Adviser.h"

#include <algorithm>
#include <utility>

#include <fmt/format.h>

#include "memory/Closing.h"
#include "report/Bytes.h"

namespace assay_host {

namespace {

constexpr DeviceKind kKinds[] = {DeviceKind::kOpenGL, DeviceKind::kOpenCL};

// Between two looks at a lock that another process has.
constexpr double kLookSeconds = 0.02;

InterfaceAdvice MakeInterfaceAdvice(Outlook outlook, const std::vector<Attempt>& attempts)
{
    InterfaceAdvice advice;
    if (const Attempt* const basis = std::exchange(outlook.fBasis, nullptr)) {
        advice.fIsLast = basis == &attempts.back();
        advice.fEnd = basis->fEnd;
        advice.fEndReason = basis->fReason;
        if (outlook.fFinding.fUsability == Usability::kBroken ||
            outlook.fFinding.fUsability == Usability::kUnknown)
            advice.fLastLine = basis->fLastLine;
    }
    advice.fOutlook = std::move(outlook);
    return advice;
}

// What another process is finding out isn't known.
void SetOther(InterfaceAdvice& advice)
{
    Outlook& outlook = advice.fOutlook;
    outlook.fFinding = {Usability::kUnknown,
                        "other-instance",
                        "Another process is trying the drivers at this moment.",
                        {},
                        {},
                        {}};
    outlook.fTime = std::nullopt;
    outlook.fNextTime = std::nullopt;
    outlook.fWarning.clear();
    advice.fIsLast = false;
    advice.fEnd = AttemptEnd::kOpen;
    advice.fEndReason.clear();
    advice.fLastLine.clear();
}

} // namespace

const char* GetPlanName(Plan plan)
{
    return plan == Plan::kAnswer ? "answer" : plan == Plan::kTry ? "try" : "wait";
}

Adviser::Adviser(Folder& folder, Machine& machine, const Identity& identity, AdviceRequest request)
    : fFolder(folder),
      fMachine(machine),
      fIdentity(identity),
      fRequest(request),
      fStore(folder),
      fChoice(fStore.LoadChoice())
{}

Adviser::State Adviser::Load()
{
    State state;
    state.fKnowledge = fStore.Load(fIdentity);
    state.fOpen = SettleOpen(state.fKnowledge.fAttempts, fMachine);
    // An attempt in progress says nothing yet.
    if (state.fOpen == OpenState::kAlive) {
        auto& attempts = state.fKnowledge.fAttempts;
        attempts.erase(std::remove_if(attempts.begin(), attempts.end(),
                                      [](const Attempt& attempt) {
                                          return attempt.fEnd == AttemptEnd::kOpen;
                                      }),
                       attempts.end());
        --state.fKnowledge.fCount;
    }
    if (!fFirstCount)
        fFirstCount = state.fKnowledge.fCount;
    return state;
}

Due Adviser::FindDue(const Knowledge& knowledge) const
{
    // While this call waited, another one may have made the fresh attempt.
    const bool isFresh = fRequest.fFresh && knowledge.fCount == fFirstCount;
    for (const DeviceKind kind : kKinds) {
        if (!fRequest.Needs(kind) || fChoice.Get(kind))
            continue;
        const Due due =
            Judge(kind, knowledge.fAttempts, fMachine.GetTime(), fRequest.fPolicy, isFresh).fDue;
        if (due != Due::kNot)
            return due;
    }
    return Due::kNot;
}

Advice Adviser::Answer(const Knowledge& knowledge, Due due)
{
    Advice advice;
    advice.fTime = fMachine.GetTime();
    advice.fName = fStore.GetName(fIdentity);
    advice.fPlan = due == Due::kNot ? Plan::kAnswer : Plan::kTry;
    advice.fDue = due;
    advice.fCount = knowledge.fCount;
    for (const DeviceKind kind : kKinds) {
        InterfaceAdvice& part = kind == DeviceKind::kOpenGL ? advice.fOpenGL : advice.fOpenCL;
        part = MakeInterfaceAdvice(Judge(kind, knowledge.fAttempts, advice.fTime, fRequest.fPolicy),
                                   knowledge.fAttempts);
        part.fChosen = fChoice.Get(kind);
    }
    advice.fMessages = fStore.GetMessages();
    return advice;
}

Advice Adviser::AnswerOther(const Knowledge& knowledge, Due due)
{
    Advice advice = Answer(knowledge, due);
    advice.fPlan = Plan::kWait;
    SetOther(advice.fOpenGL);
    SetOther(advice.fOpenCL);
    return advice;
}

Advice Adviser::Recall()
{
    const State state = Load();
    const Due due = FindDue(state.fKnowledge);
    if (state.fOpen == OpenState::kAlive && due != Due::kNot)
        return AnswerOther(state.fKnowledge, due);
    Advice advice = Answer(state.fKnowledge, due);
    advice.fIsOpen = state.fOpen == OpenState::kSettled;
    return advice;
}

Advice Adviser::Advise(const AttemptFunction& attempt, const PauseFunction& pause)
{
    State state;
    Due due = Due::kNot;
    for (double waited = 0;; waited += kLookSeconds) {
        const LockTry lock = fFolder.TryLock();
        std::string problem;
        if (lock.fState == LockState::kFailed)
            problem = fmt::format("The state can't be locked: {}.", ShowBytes(lock.fReason));
        // What the holder of the lock finds out is on the disk once it is released.
        if (waited == 0 || lock.fState != LockState::kBusy) {
            state = Load();
            due = FindDue(state.fKnowledge);
        }
        if (lock.fState != LockState::kBusy && state.fOpen != OpenState::kAlive) {
            if (due != Due::kNot)
                return Try(std::move(state.fKnowledge), due, problem, attempt);
            // After the next boot, it would look like a freeze.
            if (state.fOpen == OpenState::kSettled)
                fStore.Save(state.fKnowledge, fMachine.GetTime());
        }
        if (due == Due::kNot)
            return Answer(state.fKnowledge, due);
        if (!problem.empty())
            fStore.AddMessage(problem);
        if (waited >= fRequest.fWaitSeconds)
            return AnswerOther(state.fKnowledge, due);
        if (!pause(kLookSeconds)) {
            Advice advice = AnswerOther(state.fKnowledge, due);
            advice.fStopped = true;
            return advice;
        }
    }
}

Advice Adviser::Try(Knowledge knowledge, Due due, const std::string& lockProblem,
                    const AttemptFunction& attempt)
{
    const Advice before = Answer(knowledge, due);
    Attempt record;
    record.fStarted = record.fEnded = fMachine.GetTime();
    record.fHost = fMachine.GetSelf();
    AddAttempt(knowledge, std::move(record));
    const bool isRecorded = fStore.Save(knowledge, fMachine.GetTime());
    attempt(knowledge.fAttempts.back());
    const bool isKept = fStore.Save(knowledge, fMachine.GetTime());
    // A folder that can't be written can't be locked either.
    if (!lockProblem.empty() && (isRecorded || isKept))
        fStore.AddMessage(lockProblem);
    Advice advice = Answer(knowledge, due);
    // Otherwise the next call would read an answer that isn't true any more.
    const bool isSame = before.fOpenGL.GetUsability() == advice.fOpenGL.GetUsability() &&
                        before.fOpenCL.GetUsability() == advice.fOpenCL.GetUsability();
    if (!isRecorded && !isKept && !isSame)
        fStore.Drop(fIdentity);
    advice.fTried = true;
    advice.fStopped = knowledge.fAttempts.back().fEnd == AttemptEnd::kStopped;
    return advice;
}

} // namespace assay_host
