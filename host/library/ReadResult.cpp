// The functions that read a result.
#include <cstring>

#include "library/Result.h"
#include "library/ReturnText.h"
#include "library/Try.h"
#include "report/Unknown.h"

using namespace assay_host;

namespace {

// Returns the element, or null beyond the end or for a null object.
template <typename Object, typename Element>
const Element* Get(const Object* object, const std::vector<Element> Object::*list,
                   std::size_t index)
{
    return object != nullptr && index < (object->*list).size() ? &(object->*list)[index] : nullptr;
}

const Warning* GetWarning(const assay_host_result* result, std::size_t index)
{
    return result != nullptr && index < result->fWarnings.size() ? &result->fWarnings[index]
                                                                 : nullptr;
}

const Usable* GetUsable(const assay_host_result* result, assay_host_interface which)
{
    if (result == nullptr || (which != ASSAY_HOST_OPENGL && which != ASSAY_HOST_OPENCL))
        return nullptr;
    return &result->fUsable[which];
}

} // namespace

assay_host_verdict assay_host_result_verdict(const assay_host_result* result)
{
    return result == nullptr ? ASSAY_HOST_NEVER_STARTED
                             : static_cast<assay_host_verdict>(result->fOutcome.fVerdict);
}

const char* assay_host_result_reason(const assay_host_result* result)
{
    return result == nullptr ? "" : result->fReason.c_str();
}

int assay_host_result_exit_status(const assay_host_result* result, int* status)
{
    if (result == nullptr || !result->fOutcome.fExitStatus)
        return 0;
    if (status != nullptr)
        *status = *result->fOutcome.fExitStatus;
    return 1;
}

const char* assay_host_result_termination(const assay_host_result* result)
{
    return result == nullptr ? "" : result->fOutcome.fTermination.c_str();
}

double assay_host_result_seconds(const assay_host_result* result)
{
    return result == nullptr ? 0 : result->fOutcome.fSeconds;
}

const char* assay_host_result_last_line(const assay_host_result* result, size_t* size)
{
    return result == nullptr ? ReturnNothing(size)
                             : ReturnText(result->fOutcome.fLastReportLine, size);
}

const char* assay_host_result_last_log_line(const assay_host_result* result, size_t* size)
{
    return result == nullptr ? ReturnNothing(size)
                             : ReturnText(result->fOutcome.fLastLogLine, size);
}

size_t assay_host_result_error_line_count(const assay_host_result* result)
{
    return result == nullptr ? 0 : result->fOutcome.fErrorLines.size();
}

const char* assay_host_result_error_line(const assay_host_result* result, size_t index,
                                         size_t* size)
{
    return index < assay_host_result_error_line_count(result)
               ? ReturnText(result->fOutcome.fErrorLines[index], size)
               : ReturnNothing(size);
}

uint64_t assay_host_result_lost_bytes(const assay_host_result* result)
{
    return result == nullptr ? 0 : result->fOutcome.fLostOutputBytes;
}

uint64_t assay_host_result_lost_error_bytes(const assay_host_result* result)
{
    return result == nullptr ? 0 : result->fOutcome.fLostErrorBytes;
}

int assay_host_result_left_behind(const assay_host_result* result)
{
    return result != nullptr && result->fOutcome.fLeftBehind ? 1 : 0;
}

assay_host_usability assay_host_result_usable(const assay_host_result* result,
                                              assay_host_interface which)
{
    const Usable* const usable = GetUsable(result, which);
    return usable == nullptr ? ASSAY_HOST_UNKNOWN
                             : static_cast<assay_host_usability>(usable->fUsability);
}

const char* assay_host_result_usable_reason(const assay_host_result* result,
                                            assay_host_interface which)
{
    const Usable* const usable = GetUsable(result, which);
    return usable == nullptr ? "" : usable->fReason;
}

const char* assay_host_result_usable_text(const assay_host_result* result,
                                          assay_host_interface which)
{
    const Usable* const usable = GetUsable(result, which);
    return usable == nullptr ? "" : usable->fText.c_str();
}

const char* assay_host_result_usable_device(const assay_host_result* result,
                                            assay_host_interface which)
{
    const Usable* const usable = GetUsable(result, which);
    return usable == nullptr ? "" : usable->fTag.c_str();
}

size_t assay_host_result_warning_count(const assay_host_result* result)
{
    return result == nullptr ? 0 : result->fWarnings.size();
}

const char* assay_host_result_warning_code(const assay_host_result* result, size_t index)
{
    const Warning* const warning = GetWarning(result, index);
    return warning == nullptr ? "" : warning->fCode;
}

const char* assay_host_result_warning_device(const assay_host_result* result, size_t index)
{
    const Warning* const warning = GetWarning(result, index);
    return warning == nullptr ? "" : warning->fTag.c_str();
}

const char* assay_host_result_warning_text(const assay_host_result* result, size_t index)
{
    const Warning* const warning = GetWarning(result, index);
    return warning == nullptr ? "" : warning->fText.c_str();
}

const char* assay_host_result_warning_cause(const assay_host_result* result, size_t index)
{
    const Warning* const warning = GetWarning(result, index);
    return warning == nullptr ? "" : warning->fCause.c_str();
}

size_t assay_host_result_device_count(const assay_host_result* result)
{
    return result == nullptr ? 0 : result->fDevices.size();
}

const assay_host_device* assay_host_result_device(const assay_host_result* result, size_t index)
{
    return Get(result, &assay_host_result::fDevices, index);
}

const char* assay_host_device_tag(const assay_host_device* device)
{
    return device == nullptr ? "" : device->fDevice->fTag.c_str();
}

assay_host_interface assay_host_device_interface(const assay_host_device* device)
{
    return device != nullptr && device->fDevice->fKind == DeviceKind::kOpenCL ? ASSAY_HOST_OPENCL
                                                                              : ASSAY_HOST_OPENGL;
}

int assay_host_device_complete(const assay_host_device* device)
{
    return device != nullptr && device->fDevice->fComplete ? 1 : 0;
}

int assay_host_device_failed(const assay_host_device* device)
{
    return device != nullptr && device->fDevice->fFailed ? 1 : 0;
}

int assay_host_device_software(const assay_host_device* device)
{
    return device == nullptr ? -1 : device->fSoftware;
}

const assay_host_answer* assay_host_result_find(const assay_host_result* result, const char* key)
{
    if (result == nullptr || key == nullptr)
        return nullptr;
    const assay_host_answer* answer = nullptr;
    Try([&] {
        const auto place = result->fByKey.find(key);
        if (place != result->fByKey.end())
            answer = &result->fAllAnswers[place->second];
        return ASSAY_HOST_OK;
    });
    return answer;
}

size_t assay_host_result_answer_count(const assay_host_result* result)
{
    return result == nullptr ? 0 : result->fAllAnswers.size();
}

const assay_host_answer* assay_host_result_answer(const assay_host_result* result, size_t index)
{
    return Get(result, &assay_host_result::fAllAnswers, index);
}

const char* assay_host_answer_key(const assay_host_answer* answer)
{
    return answer == nullptr ? "" : answer->fKey.c_str();
}

assay_host_kind assay_host_answer_kind(const assay_host_answer* answer)
{
    return answer == nullptr ? ASSAY_HOST_NOTHING : answer->fKind;
}

const char* assay_host_answer_reason(const assay_host_answer* answer)
{
    if (answer == nullptr)
        return "no such key";
    return answer->fAnswer->fLine == nullptr ? GetMissingText(answer->fAnswer->fMissing)
                                             : GetUnknownText(answer->fAnswer->fUnknown);
}

const char* assay_host_answer_text(const assay_host_answer* answer, size_t* size)
{
    return answer == nullptr || answer->fAnswer->fLine == nullptr
               ? ReturnNothing(size)
               : ReturnText(answer->fAnswer->fLine->fValue, size);
}

double assay_host_answer_number(const assay_host_answer* answer)
{
    return answer == nullptr ? 0 : answer->fNumber;
}

int assay_host_answer_flag(const assay_host_answer* answer)
{
    return answer == nullptr ? -1 : answer->fFlag;
}

size_t assay_host_answer_list_size(const assay_host_answer* answer)
{
    return answer == nullptr ? 0 : answer->fList.size();
}

double assay_host_answer_list_item(const assay_host_answer* answer, size_t index)
{
    return index < assay_host_answer_list_size(answer) ? answer->fList[index] : 0;
}

const char* assay_host_result_document(const assay_host_result* result, size_t* size)
{
    const char* document = nullptr;
    ReturnNothing(size);
    if (result != nullptr)
        Try([&] {
            document = ReturnText(result->GetDocument(), size);
            return ASSAY_HOST_OK;
        });
    return document;
}
