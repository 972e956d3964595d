// The JSON document of a comparison. host/schema/assay-diff-1.schema.json has its schema.
#pragma once

#include <ostream>
#include <string>

#include "report/ComparedRuns.h"

namespace assay_host {

constexpr int kDiffSchemaVersion = 1;

// Writes the document and a line end, piece by piece. `hostVersion`: of assay-host. Doesn't check
// the stream for failures. Any thread may call.
void WriteDiffDocument(std::ostream& out, const ComparedRuns& runs, const std::string& hostVersion);

} // namespace assay_host
