#include <algorithm>
#include <cstdio>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <fmt/format.h>

#include "app/Checker.h"
#include "app/Commands.h"
#include "app/FindAssay.h"
#include "app/PolicyTime.h"
#include "facts/TimeText.h"
#include "identity/Identity.h"
#include "memory/Adviser.h"
#include "memory/Store.h"
#include "output/Output.h"
#include "report/Bytes.h"

namespace assay_host {

namespace {

// Returns why nothing is known of the machine as it is now.
std::string GetNothingKnown(const Advice& advice, DeviceKind kind, Store& store)
{
    const std::vector<StoredKnowledge> all = store.List();
    const auto other =
        std::find_if(all.begin(), all.end(), [&advice](const StoredKnowledge& entry) {
            return entry.fKnowledge && entry.fName != advice.fName;
        });
    if (other == all.end())
        return fmt::format("{} has not been tried.", GetKindName(kind));
    return fmt::format("{} has not been tried since the machine, a driver or assay changed; the "
                       "newest result is of {}.",
                       GetKindName(kind), MakeUtcText(other->fTime));
}

// What was learnt counts. The user's choice says nothing about the machine.
RememberedInterface Remember(const Advice& advice, DeviceKind kind, Folder& folder)
{
    const Finding& finding = advice.Get(kind).fOutlook.fFinding;
    if (finding.fReason == "not-tried" && advice.fCount == 0) {
        Store store(folder);
        return {Usability::kUnknown, GetNothingKnown(advice, kind, store)};
    }
    return {finding.fUsability, ShowBytes(finding.fText)};
}

} // namespace

int CheckState(const CheckChoice& choice)
{
    Checker checker(choice);
    const Identity identity = GetIdentity(MakeChildOptions(choice.fChild).fProgram);
    const std::unique_ptr<Folder> folder = OpenUsableFolder(choice.fState);
    AdviceRequest request;
    request.fNeedsOpenGL = checker.RequiresUsable(DeviceKind::kOpenGL);
    request.fNeedsOpenCL = checker.RequiresUsable(DeviceKind::kOpenCL);
    request.fPolicy.fMaxAge = ToSeconds(choice.fMaxAgeDays, Policy::kDay);
    const std::unique_ptr<Machine> machine = MakeSystemMachine();
    const Advice advice = Adviser(*folder, *machine, identity, request).Recall();
    for (const std::string& message : advice.fMessages)
        std::fprintf(stderr, "assay-host: %s\n", message.c_str());
    const bool isMet = checker.CheckMemory(Remember(advice, DeviceKind::kOpenGL, *folder),
                                           Remember(advice, DeviceKind::kOpenCL, *folder));
    OpenStandardOutput()->Write(checker.GetText());
    return isMet ? 0 : kUnmetStatus;
}

} // namespace assay_host
