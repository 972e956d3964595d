#include "report/LostAnswers.h"

#include "report/Bytes.h"

namespace assay_host {

namespace {

void AppendToList(std::string& list, const std::string& item)
{
    list += list.empty() ? "" : ", ";
    list += item;
}

// `all`: replaces the labels if every key of the group is missing; null for no replacement.
void AppendGroup(std::string& labels, const DeviceAnswers& device, KeyGroup group, Missing missing,
                 const char* all)
{
    std::string some;
    bool isAll = all != nullptr;
    for (const Answer& answer : device.fAnswers) {
        if (!answer.fKnown || answer.fKnown->fGroup != group)
            continue;
        if (answer.fMissing == missing)
            AppendToList(some, GetLabel(answer));
        else
            isAll = false;
    }
    if (!some.empty())
        AppendToList(labels, isAll ? all : some);
}

} // namespace

std::string GetLabel(const Answer& answer)
{
    return answer.fKnown ? answer.fKnown->fLabel : ShowBytes(answer.fKey);
}

bool IsLost(const Answer& answer)
{
    return !answer.fLine && answer.fMissing != Missing::kNotPrinted;
}

std::vector<LostAnswers> ListLost(const DeviceAnswers& device)
{
    std::vector<LostAnswers> lost;
    for (const Missing missing :
         {Missing::kUnreadable, Missing::kDeviceFailed, Missing::kRunEnded}) {
        std::string labels;
        AppendGroup(labels, device, KeyGroup::kMain, missing, nullptr);
        AppendGroup(labels, device, KeyGroup::kLimit, missing, "all limits");
        AppendGroup(labels, device, KeyGroup::kExtension, missing, "all extensions");
        if (!labels.empty())
            lost.push_back({missing, labels});
    }
    return lost;
}

} // namespace assay_host
