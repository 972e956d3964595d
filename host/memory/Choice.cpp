#include "memory/Choice.h"

#include <stdexcept>
#include <utility>

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

constexpr std::pair<const char*, DeviceKind> kKinds[] = {{"opengl", DeviceKind::kOpenGL},
                                                         {"opencl", DeviceKind::kOpenCL}};
constexpr Usability kValues[] = {Usability::kHardware, Usability::kSoftware, Usability::kAbsent};

std::optional<Usability> FindValue(const std::string& name)
{
    for (const Usability value : kValues)
        if (name == GetUsabilityName(value))
            return value;
    return std::nullopt;
}

} // namespace

std::optional<ChoiceWord> ReadChoiceWord(const std::string& word)
{
    const std::size_t mark = word.find('=');
    if (mark == std::string::npos)
        return std::nullopt;
    const std::string value = word.substr(mark + 1);
    const auto usability = FindValue(value);
    if (!usability && value != "auto")
        return std::nullopt;
    for (const auto& [name, kind] : kKinds)
        if (word.substr(0, mark) == name)
            return ChoiceWord{kind, usability};
    return std::nullopt;
}

Json MakeChoiceJson(const Choice& choice)
{
    Json json = {{"choice", Json::object()}};
    for (const auto& [name, kind] : kKinds)
        if (const auto& chosen = choice.Get(kind))
            json["choice"][name] = {{"answer", GetUsabilityName(chosen->fUsability)},
                                    {"time", chosen->fTime}};
    return json;
}

Choice ReadChoiceJson(const Json& content)
{
    Choice choice;
    const Json& json = content.at("choice");
    for (const auto& [name, kind] : kKinds) {
        const auto found = json.find(name);
        if (found == json.end())
            continue;
        const auto usability = FindValue(found->at("answer").get_ref<const std::string&>());
        if (!usability)
            throw std::runtime_error("no answer to choose");
        choice.Get(kind) = {*usability, found->at("time").get<std::int64_t>()};
    }
    return choice;
}

} // namespace assay_host
