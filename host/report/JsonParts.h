// The parts that the JSON document and the events have in common. Any thread may call.
#pragma once

#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "report/ReportLine.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Returns "value", "comment" or "raw".
const char* GetLineKindName(LineKind kind);

// Makes any number a valid JSON number of seconds: JSON has no infinity.
double MakeSeconds(double seconds);

// Make strings of any bytes.
nlohmann::ordered_json MakeText(const std::string& bytes);
nlohmann::ordered_json MakeTextOrNull(const std::string& bytes); // null for an empty text
nlohmann::ordered_json MakeTexts(const std::vector<std::string>& texts);

nlohmann::ordered_json MakeLine(const ReportLine& line);

nlohmann::ordered_json MakeOutcome(const RunOutcome& outcome);
nlohmann::ordered_json MakeFirstOutcome(const RunOutcome& outcome); // of the first schema

} // namespace assay_host
