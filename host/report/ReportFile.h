// A report from a file of any of its forms.
#pragma once

#include <string>

#include "report/Report.h"

namespace assay_host {

// The file holds a JSON document, the events of the JSON Lines form, or the report's own lines. Its
// first byte that is no blank tells: '{' is JSON. The path is UTF-8. Throws std::runtime_error,
// with the path in its text, if the file can't be read or holds none of these.
Report LoadReport(const std::string& path);

} // namespace assay_host
