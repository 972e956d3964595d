#include "requirements/RequirementFile.h"

#include <filesystem>
#include <fstream>
#include <stdexcept>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

namespace assay_host {

std::vector<Requirement> ReadRequirements(std::istream& text)
{
    using Json = nlohmann::json;
    const Json file = Json::parse(text, nullptr, false);
    if (file.is_discarded())
        throw std::runtime_error("not valid JSON");
    if (!file.is_object() || !file.contains("require") || !file["require"].is_array())
        throw std::runtime_error("has no array \"require\"");
    std::vector<Requirement> requirements;
    for (const Json& requirement : file["require"]) {
        if (!requirement.is_string())
            throw std::runtime_error(
                fmt::format("\"require\" has an element that is no string but of the type {}",
                            requirement.type_name()));
        requirements.push_back(ParseRequirement(requirement.get<std::string>()));
    }
    if (requirements.empty())
        throw std::runtime_error("\"require\" is empty");
    return requirements;
}

std::vector<Requirement> LoadRequirements(const std::string& path)
{
    std::ifstream file(std::filesystem::u8path(path), std::ios::binary);
    try {
        if (!file)
            throw std::runtime_error("cannot be opened");
        return ReadRequirements(file);
    } catch (const std::runtime_error& failure) {
        throw std::runtime_error(path + ": " + failure.what());
    }
}

} // namespace assay_host
