// Makes the parts of a document that the second schema added. Any thread may call.
#pragma once

#include <vector>

#include <nlohmann/json.hpp>

#include "report/Answers.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"
#include "report/Usable.h"
#include "report/Warnings.h"

namespace assay_host {

// Makes {"known": true, "value": ...} or {"known": false, "reason": ...}.
nlohmann::ordered_json MakeFact(const Fact& fact);

nlohmann::ordered_json MakeVersions(const RunFacts& facts);
nlohmann::ordered_json MakeEnvironment(const Environment& environment);

// Makes the results for both interfaces, under "opengl" and "opencl".
nlohmann::ordered_json MakeUsable(const Answers& answers, const RunOutcome& outcome);

nlohmann::ordered_json MakeWarnings(const std::vector<Warning>& warnings);
nlohmann::ordered_json MakeLowerBounds(const RunOutcome& outcome);
nlohmann::ordered_json MakeCauses(const RunOutcome& outcome);

// Makes {"known": true, "files": [...]} or {"known": false, "reason": ...}.
nlohmann::ordered_json MakeDrivers(const LoadedFiles& drivers);

// Makes {"known": true, "flag": ...}: whether the device is a software renderer.
nlohmann::ordered_json MakeSoftware(const DeviceAnswers& device);

} // namespace assay_host
