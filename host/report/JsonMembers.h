// Reads members of JSON objects whose types are required. Any thread may call.
#pragma once

#include <string>

#include <nlohmann/json.hpp>

namespace assay_host {

using JsonTypeTest = bool (nlohmann::ordered_json::*)() const noexcept;

// Returns a required member. Throws std::runtime_error with the text "WHERE: "NAME" is missing" or
// "WHERE: "NAME" is not TYPE".
const nlohmann::ordered_json& GetMember(const nlohmann::ordered_json& object,
                                        const std::string& where, const char* name,
                                        JsonTypeTest isType, const char* type);

// Returns a required text. Throws as GetMember does.
std::string GetString(const nlohmann::ordered_json& object, const std::string& where,
                      const char* name);

} // namespace assay_host
