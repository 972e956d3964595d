#include "app/RunParts.h"

#include <memory>
#include <ostream>
#include <utility>

#include "app/Forms.h"
#include "app/NeedStatus.h"
#include "facts/Environment.h"
#include "facts/FileVersion.h"
#include "output/Terminal.h"
#include "report/Answers.h"
#include "report/Usable.h"

namespace assay_host {

RunFacts MakeRunFacts(const RunChoice& choice, const std::string& program)
{
    RunFacts facts;
    facts.fHostVersion = ASSAY_VERSION;
    if (choice.fFormat != Format::kText) {
        facts.fChildVersion = GetFileVersion(program);
        facts.fEnvironment = GetEnvironment(choice.fIdentify);
    }
    return facts;
}

int GetRunStatus(Need need, const Report& report, const RunOutcome& outcome)
{
    if (need == Need::kNothing)
        return GetVerdictStatus(outcome.fVerdict);
    const Answers answers = GetAnswers(report);
    return GetNeedStatus(need, JudgeUsable(DeviceKind::kOpenGL, answers, outcome).fUsability,
                         JudgeUsable(DeviceKind::kOpenCL, answers, outcome).fUsability);
}

void WriteRun(WriterThread& writer, const RunChoice& choice, StoredRun run)
{
    const Form form = {choice.fFormat, choice.fSchema,
                       choice.fOutput.empty() ? GetOutputWidth() : kFileWidth};
    const auto shared = std::make_shared<const StoredRun>(std::move(run));
    writer.WriteLarge([form, shared](std::ostream& out) { WriteForm(out, form, *shared); });
}

} // namespace assay_host
