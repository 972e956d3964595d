// The JSON document of a run. host/schema has its schemas. Texts are encoded by EncodeBytes.
//
// Any thread may call.
#pragma once

#include <ostream>

#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"
#include "series/Series.h"

namespace assay_host {

// Incremented when the document changes in a way that breaks existing readers. The first one is
// still written on request; both are read.
constexpr int kSchemaVersion = 2;
constexpr int kFirstSchemaVersion = 1;

// Writes the document and a line end, piece by piece. `series`: that of which the run is shown;
// null for a run that wasn't repeated. Doesn't check the stream for failures.
void WriteDocument(std::ostream& out, const Report& report, const RunOutcome& outcome,
                   const RunFacts& facts, const Series* series = nullptr);

// Writes the document of the first schema.
void WriteFirstDocument(std::ostream& out, const Report& report, const RunOutcome& outcome);

} // namespace assay_host
