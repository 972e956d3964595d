#include "requirements/RequirementCheck.h"

#include <algorithm>
#include <cstddef>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/Numbers.h"
#include "report/Usable.h"

namespace assay_host {

namespace {

// Devices that one line names. The others are counted.
constexpr std::size_t kMaxNamed = 8;

std::string GetReason(const Answer& answer)
{
    return answer.fLine == nullptr ? GetMissingText(answer.fMissing)
                                   : GetUnknownText(answer.fUnknown);
}

// Reads a number, or a list of one as the limits of a driver are.
std::optional<double> ReadValueNumber(std::string_view text)
{
    if (text.size() > 2 && text.front() == '[' && text.back() == ']')
        text = text.substr(1, text.size() - 2);
    return ReadDouble(text);
}

// Returns why the value doesn't meet the requirement; empty if it does.
std::string FindUnmetValue(const Requirement& requirement, const Answer& answer)
{
    if (!answer.IsKnown())
        return fmt::format("not known ({})", GetReason(answer));
    const std::string& value = answer.fLine->fValue;
    bool holds = false;
    if (const auto* const number = std::get_if<double>(&requirement.fWanted)) {
        const auto found = ReadValueNumber(value);
        holds = found && Holds(requirement.fRelation, *found, *number);
    } else if (const auto* const version = std::get_if<Version>(&requirement.fWanted)) {
        const auto found = ReadVersion(value);
        holds = found && Holds(requirement.fRelation, *found, *version);
    } else {
        holds = Holds(requirement.fRelation, value, std::get<std::string>(requirement.fWanted));
    }
    return holds ? std::string() : ShowBytes(value);
}

const Answer& Get(const std::vector<Answer>& answers, const KnownKey& key)
{
    return *std::find_if(answers.begin(), answers.end(),
                         [&key](const Answer& answer) { return answer.fKnown == &key; });
}

// Returns why there is no device for the requirement.
std::string FindNoDevice(const Requirement& requirement, DeviceKind kind, const Answers& answers)
{
    const Answer& total = Get(answers.fReport, *FindKnownKey(std::nullopt, GetCountKey(kind)));
    if (!total.IsKnown() && total.fMissing != Missing::kNoOpenCL)
        return fmt::format("not known ({})", GetReason(total));
    if (requirement.fDevice)
        return fmt::format("there is no {}", MakeTag(kind, requirement.fDevice->fIndex));
    return fmt::format("there is no {} device", GetKindName(kind));
}

std::string FindUnmetDevices(const Requirement& requirement, const KnownKey& key,
                             const Answers& answers)
{
    std::vector<std::string> unmet;
    std::size_t count = 0;
    for (const DeviceAnswers& device : answers.fDevices) {
        const bool isMeant = !requirement.fDevice || device.fIndex == requirement.fDevice->fIndex;
        if (device.fKind != key.fKind || !isMeant)
            continue;
        ++count;
        const std::string found = FindUnmetValue(requirement, Get(device.fAnswers, key));
        if (!found.empty())
            unmet.push_back(device.fTag + " " + found);
        else if (requirement.fScope == Scope::kAny)
            return {};
    }
    if (count == 0)
        return FindNoDevice(requirement, *key.fKind, answers);
    const std::size_t named = std::min(unmet.size(), kMaxNamed);
    std::string text;
    for (std::size_t index = 0; index < named; ++index)
        text += (index == 0 ? "" : ", ") + unmet[index];
    if (unmet.size() > named)
        text += fmt::format(" and {} more", unmet.size() - named);
    return text;
}

bool MeetsUsability(const Requirement& requirement, Usability found)
{
    const bool isWanted = found == std::get<Usability>(requirement.fWanted);
    return isWanted == (requirement.fRelation == Relation::kEqual);
}

std::string FindUnmetFact(const Requirement& requirement, const FactOf& fact,
                          const Answers& answers, const RunOutcome& outcome)
{
    if (fact.fFact == InterfaceFact::kUsable) {
        const Usable usable = JudgeUsable(fact.fKind, answers, outcome);
        if (MeetsUsability(requirement, usable.fUsability))
            return {};
        return fmt::format("{} ({})", GetUsabilityName(usable.fUsability), ShowBytes(usable.fText));
    }
    const KnownKey* const key = FindKnownKey(std::nullopt, GetCountKey(fact.fKind));
    const Answer& answer = Get(answers.fReport, *key);
    // Without the library there are no devices for certain.
    if (answer.fMissing != Missing::kNoOpenCL)
        return FindUnmetValue(requirement, answer);
    return Holds(requirement.fRelation, 0.0, std::get<double>(requirement.fWanted))
               ? ""
               : "0 (no OpenCL)";
}

} // namespace

std::string FindUnmet(const Requirement& requirement, const Answers& answers,
                      const RunOutcome& outcome)
{
    if (const auto* const fact = std::get_if<FactOf>(&requirement.fSubject))
        return FindUnmetFact(requirement, *fact, answers, outcome);
    const KnownKey& key = *std::get<const KnownKey*>(requirement.fSubject);
    return key.fKind ? FindUnmetDevices(requirement, key, answers)
                     : FindUnmetValue(requirement, Get(answers.fReport, key));
}

std::string FindUnmetInMemory(const Requirement& requirement, const RememberedInterface& opengl,
                              const RememberedInterface& opencl)
{
    const auto* const fact = std::get_if<FactOf>(&requirement.fSubject);
    if (fact == nullptr || fact->fFact != InterfaceFact::kUsable)
        return "not kept in the state; check without --state";
    const RememberedInterface& found = fact->fKind == DeviceKind::kOpenGL ? opengl : opencl;
    if (found.fUsability == Usability::kUnknown)
        return fmt::format("not known ({})", found.fText);
    if (MeetsUsability(requirement, found.fUsability))
        return {};
    return fmt::format("{} ({})", GetUsabilityName(found.fUsability), found.fText);
}

} // namespace assay_host
