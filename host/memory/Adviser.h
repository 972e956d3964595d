// Answers what a host should do with the graphics drivers, from memory or by one guarded attempt.
#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "memory/Closing.h"
#include "memory/Folder.h"
#include "memory/Machine.h"
#include "memory/Policy.h"
#include "memory/Store.h"

namespace assay_host {

struct AdviceRequest {
    bool fNeedsOpenGL = true; // the interfaces that may cause an attempt
    bool fNeedsOpenCL = false;
    bool fFresh = false;      // results of attempts before this call are due
    double fWaitSeconds = 10; // for the attempt of another process
    Policy fPolicy;

    bool Needs(DeviceKind kind) const
    {
        return kind == DeviceKind::kOpenGL ? fNeedsOpenGL : fNeedsOpenCL;
    }
};

enum class Plan {
    kAnswer, // memory has the answer
    kTry,    // an attempt is due
    kWait    // another process makes one
};

// Returns "answer", "try" or "wait".
const char* GetPlanName(Plan plan);

struct InterfaceAdvice {
    Outlook fOutlook; // what was learnt; its fBasis is null
    std::optional<InterfaceChoice> fChosen;
    bool fIsLast = false;                // the finding is of the last attempt
    AttemptEnd fEnd = AttemptEnd::kOpen; // of the attempt with the finding; kOpen for none
    std::string fEndReason;              // its sentence
    std::string fLastLine;               // the child's last line, if it didn't end well

    // The user's choice, or what was found.
    Usability GetUsability() const
    {
        return fChosen ? fChosen->fUsability : fOutlook.fFinding.fUsability;
    }
};

struct Advice {
    std::int64_t fTime = 0; // of the answer
    std::string fName;      // of the identity
    Plan fPlan = Plan::kAnswer;
    Due fDue = Due::kNot;     // why an attempt is due
    bool fTried = false;      // this call made one
    bool fIsOpen = false;     // an attempt is on the disk whose host ended; Advise closes it
    bool fStopped = false;    // this call was asked to stop
    std::uint64_t fCount = 0; // of all attempts with this identity
    InterfaceAdvice fOpenGL;
    InterfaceAdvice fOpenCL;
    std::vector<std::string> fMessages; // problems with the state, each a sentence

    const InterfaceAdvice& Get(DeviceKind kind) const
    {
        return kind == DeviceKind::kOpenGL ? fOpenGL : fOpenCL;
    }
};

// Runs the child and closes the attempt. Its exceptions leave Adviser::Advise.
using AttemptFunction = std::function<void(Attempt&)>;

// Waits for this time. Returns false if the call was asked to stop.
using PauseFunction = std::function<bool(double seconds)>;

// For one call of a host. The folder, the machine and the identity must outlive it. One thread at a
// time; several objects, also of one process, may use one folder.
class Adviser {
public:
    Adviser(Folder& folder, Machine& machine, const Identity& identity, AdviceRequest request);

    // Answers from memory, and plans. Writes nothing and doesn't wait.
    Advice Recall();

    // Makes at most one attempt if one is due. It is on the disk before `attempt` is called; if it
    // can't be written, a message says so. While another process makes one, waits as requested.
    Advice Advise(const AttemptFunction& attempt, const PauseFunction& pause);

private:
    // What is on the disk, with the attempts closed whose hosts ended.
    struct State {
        Knowledge fKnowledge;
        OpenState fOpen = OpenState::kNone;
    };

    State Load();
    Due FindDue(const Knowledge& knowledge) const;
    Advice Answer(const Knowledge& knowledge, Due due);
    Advice AnswerOther(const Knowledge& knowledge, Due due);
    Advice Try(Knowledge knowledge, Due due, const std::string& lockProblem,
               const AttemptFunction& attempt);

    Folder& fFolder;
    Machine& fMachine;
    const Identity& fIdentity;
    const AdviceRequest fRequest;
    Store fStore;
    const Choice fChoice;
    std::optional<std::uint64_t> fFirstCount; // of the attempts before this call
};

} // namespace assay_host
