// Reads the report of a run from its JSON forms, of either schema.
//
// Any thread may call.
#pragma once

#include <istream>
#include <string>

#include "report/Report.h"
#include "report/StoredRun.h"

namespace assay_host {

// Reads the report of a document, without holding the other parts of it. Throws std::runtime_error
// that names the first error in the document.
Report ReadDocument(std::istream& text);

// Reads the report of a run's events. Ignores a last line that is incomplete, as a killed host
// leaves it. Throws std::runtime_error that names the first error, "line N: REASON".
Report ReadEvents(std::istream& text);

// The same with the outcome and the facts, which the events may lack: a run without its end has the
// outcome of MakeOutcomeOfReport().
StoredRun ReadDocumentRun(std::istream& text);
StoredRun ReadEventsRun(std::istream& text);

// Whether the line is a JSON object with the member "event".
bool IsEvent(const std::string& line);

} // namespace assay_host
