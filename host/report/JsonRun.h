// Reads what a document has besides the lines of the report: the reverse of JsonParts and
// JsonFacts.
//
// Any thread may call. The functions throw std::runtime_error that names the first error.
#pragma once

#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "report/RunFacts.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Reads the members "outcome" and "drivers" of a document or an event, of either schema, but not
// the command.
RunOutcome ReadOutcome(const nlohmann::ordered_json& object, const std::string& where);

// Reads the member "command".
std::vector<std::string> ReadCommand(const nlohmann::ordered_json& object,
                                     const std::string& where);

// Reads the members "versions" and "environment" of the second schema.
RunFacts ReadFacts(const nlohmann::ordered_json& object, const std::string& where);

// Returns facts that are all unknown for this reason.
RunFacts MakeUnknownFacts(const std::string& reason);

} // namespace assay_host
