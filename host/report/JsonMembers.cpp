#include "report/JsonMembers.h"

#include <stdexcept>

#include <fmt/format.h>

namespace assay_host {

using Json = nlohmann::ordered_json;

const Json& GetMember(const Json& object, const std::string& where, const char* name,
                      JsonTypeTest isType, const char* type)
{
    const auto member = object.find(name);
    if (member == object.end())
        throw std::runtime_error(fmt::format("{}: \"{}\" is missing", where, name));
    if (!((*member).*isType)())
        throw std::runtime_error(fmt::format("{}: \"{}\" is not {}", where, name, type));
    return *member;
}

std::string GetString(const Json& object, const std::string& where, const char* name)
{
    return GetMember(object, where, name, &Json::is_string, "a string").get<std::string>();
}

} // namespace assay_host
