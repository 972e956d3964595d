// The member "series" of a document. Any thread may call.
#pragma once

#include <string>

#include <nlohmann/json_fwd.hpp>

#include "report/JsonWriter.h"
#include "series/Series.h"

namespace assay_host {

// Writes the member with all samples, the statistics and their definitions.
void WriteSeries(JsonWriter& json, const Series& series);

// Reads the member's value. The statistics aren't read: they follow from the samples. Throws
// std::runtime_error that names the first error.
Series ReadSeries(const nlohmann::ordered_json& json, const std::string& where);

} // namespace assay_host
