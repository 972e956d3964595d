// The events of a run in the JSON Lines form. host/schema has their schemas. Each is a JSON object
// on one line, with its line end. Texts are encoded by EncodeBytes.
//
// Any thread may call.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/ReportLine.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Makes the event "start" of a run, 0 seconds after its launch.
std::string MakeStartEvent(const std::vector<std::string>& command, const RunFacts& facts);
std::string MakeFirstStartEvent(const std::vector<std::string>& command);

// Makes the event "line", `seconds` after the launch.
std::string MakeLineEvent(const ReportLine& line, double seconds);

// Makes the event "error" of a line of standard error, `seconds` after the launch.
std::string MakeErrorLineEvent(const std::string& line, double seconds);

// Makes the event "end".
std::string MakeEndEvent(const Answers& answers, const RunOutcome& outcome);
std::string MakeFirstEndEvent(const RunOutcome& outcome);

} // namespace assay_host
