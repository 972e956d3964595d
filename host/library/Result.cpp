#include "library/Result.h"

#include <sstream>
#include <utility>
#include <variant>

#include "report/Bytes.h"
#include "report/JsonDocument.h"
#include "report/LineForm.h"
#include "report/Numbers.h"
#include "report/Software.h"

using namespace assay_host;

namespace {

double ToDouble(const Number& number)
{
    return std::visit([](auto value) { return static_cast<double>(value); }, number);
}

int GetFlag(const Answer& answer)
{
    const std::string& value = answer.fLine->fValue;
    const bool isFlag = answer.fKnown != nullptr && answer.fKnown->fForm == ValueForm::kFlag &&
                        (value == "0" || value == "1");
    return isFlag ? value == "1" : -1;
}

// Sets what depends on the value of a known answer.
void SetValue(assay_host_answer& made)
{
    const ReportLine& line = *made.fAnswer->fLine;
    made.fKind = ASSAY_HOST_TEXT;
    made.fFlag = GetFlag(*made.fAnswer);
    if (line.fQuoted)
        return;
    if (const auto number = ReadNumber(line.fValue)) {
        made.fKind = ASSAY_HOST_NUMBER;
        made.fNumber = ToDouble(*number);
    } else if (const auto numbers = ReadNumberList(line.fValue)) {
        made.fKind = ASSAY_HOST_LIST;
        for (const Number& each : *numbers)
            made.fList.push_back(ToDouble(each));
    }
}

int GetSoftware(const DeviceAnswers& device)
{
    if (!FindSoftwareText(device).empty())
        return 1;
    return CanTellSoftware(device) ? 0 : -1;
}

} // namespace

assay_host_result::assay_host_result(Report report, RunOutcome outcome, RunFacts facts)
    : fReport(std::move(report)),
      fOutcome(std::move(outcome)),
      fFacts(std::move(facts)),
      fAnswers(GetAnswers(fReport)),
      fReason(ShowBytes(fOutcome.fReason)),
      fUsable{JudgeUsable(DeviceKind::kOpenGL, fAnswers, fOutcome),
              JudgeUsable(DeviceKind::kOpenCL, fAnswers, fOutcome)},
      fWarnings(GetWarnings(fAnswers, fOutcome))
{
    for (const Answer& answer : fAnswers.fReport)
        Add({}, answer);
    for (const DeviceAnswers& device : fAnswers.fDevices) {
        fDevices.push_back({&device, GetSoftware(device)});
        for (const Answer& answer : device.fAnswers)
            Add(device.fTag + ".", answer);
    }
}

void assay_host_result::Add(const std::string& tag, const Answer& answer)
{
    assay_host_answer made;
    made.fAnswer = &answer;
    made.fKey = tag + answer.fKey;
    if (answer.IsKnown())
        SetValue(made);
    fByKey.emplace(made.fKey, fAllAnswers.size());
    fAllAnswers.push_back(std::move(made));
}

const std::string& assay_host_result::GetDocument() const
{
    const std::lock_guard<std::mutex> lock(fMutex);
    if (!fDocument) {
        std::ostringstream text;
        text.imbue(std::locale::classic());
        text.exceptions(std::ios::badbit);
        WriteDocument(text, fReport, fOutcome, fFacts);
        fDocument = text.str();
    }
    return *fDocument;
}
