// The content of a state file with the knowledge of one identity. Any thread may call.
#pragma once

#include <string>
#include <string_view>

#include <nlohmann/json.hpp>

#include "memory/Attempt.h"
#include "memory/Envelope.h"

namespace assay_host {

nlohmann::ordered_json MakeIdentityJson(const Identity& identity);

// Makes the content. Bytes that aren't text are encoded as EncodeBytes() does.
nlohmann::ordered_json MakeKnowledgeJson(const Knowledge& knowledge);

// Reads a name of GetUsabilityName. Throws std::runtime_error for any other.
Usability ReadUsability(const std::string& name);

// Reads the content. Throws std::exception if a member is missing or has a wrong type or value.
Knowledge ReadKnowledgeJson(const nlohmann::ordered_json& content);

// Reads all but the identity, which is left empty. Throws as ReadKnowledgeJson.
Knowledge ReadAttemptsJson(const nlohmann::ordered_json& content);

// Returns the name of the identity's state file without its ending. `identity` is of
// MakeIdentityJson.
std::string GetIdentityName(const nlohmann::ordered_json& identity);

} // namespace assay_host
