// The HTML form of a comparison.
#pragma once

#include <ostream>
#include <string>

#include "report/ComparedRuns.h"

namespace assay_host {

// Writes the page, with the document of WriteDiffDocument(). `hostVersion`: of assay-host. Texts of
// the driver are escaped. Doesn't check the stream for failures.
void WriteDiffPage(std::ostream& out, const ComparedRuns& runs, const std::string& hostVersion);

} // namespace assay_host
