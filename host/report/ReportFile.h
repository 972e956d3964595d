// Loads a report from a file of any of its forms.
#pragma once

#include <string>

#include "report/Report.h"
#include "report/StoredRun.h"

namespace assay_host {

// Accepts a JSON document, the events of the JSON Lines form, and the report's own lines. A file
// whose first byte after blanks is '{' is JSON. The path is UTF-8.
//
// Throws std::runtime_error with the text "PATH: REASON" if the file can't be read or is no report.
// Any thread may call.
Report LoadReport(const std::string& path);

// Loads a whole run. Of a file that has only the report's own lines, the outcome is that of
// MakeOutcomeOfReport() and the facts are unknown. Accepts and throws as LoadReport does.
StoredRun LoadRun(const std::string& path);

} // namespace assay_host
