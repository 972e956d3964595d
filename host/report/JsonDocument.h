// The JSON forms of a run: the document, and the events of the JSON Lines form. host/schema has
// their schemas.
//
// JSON is Unicode, and a driver's bytes need not be. A byte that isn't part of well-formed UTF-8 is
// written as the character 0xF700 plus the byte, in the private range U+F780 to U+F7FF. The bytes
// of a real character of that range are written the same way, so that decoding is exact.
//
// Any thread may call.
#pragma once

#include <istream>
#include <ostream>
#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Incremented when the document changes in a way that breaks existing readers. The first one is
// still written on request; both are read.
constexpr int kSchemaVersion = 2;
constexpr int kFirstSchemaVersion = 1;

// Writes the document and a line end, piece by piece. Doesn't check the stream for failures.
void WriteDocument(std::ostream& out, const Report& report, const RunOutcome& outcome,
                   const RunFacts& facts);

// Writes the document of the first schema.
void WriteFirstDocument(std::ostream& out, const Report& report, const RunOutcome& outcome);

// Makes the event "start" of a run, 0 seconds after its launch. Every event is a JSON object on one
// line, with its line end.
std::string MakeStartEvent(const std::vector<std::string>& command, const RunFacts& facts);
std::string MakeFirstStartEvent(const std::vector<std::string>& command);

// Makes the event "line", `seconds` after the launch.
std::string MakeLineEvent(const ReportLine& line, double seconds);

// Makes the event "error" of a line of standard error, `seconds` after the launch.
std::string MakeErrorLineEvent(const std::string& line, double seconds);

// Makes the event "end".
std::string MakeEndEvent(const Answers& answers, const RunOutcome& outcome);
std::string MakeFirstEndEvent(const RunOutcome& outcome);

// Reads the report of a document, without holding the other parts of it. Throws std::runtime_error
// that names the first error in the document.
Report ReadDocument(std::istream& text);

// Reads the report of a run's events. Ignores a last line that is incomplete, as a killed host
// leaves it. Throws std::runtime_error that names the first error, "line N: REASON".
Report ReadEvents(std::istream& text);

// Whether the line is a JSON object with the member "event".
bool IsEvent(const std::string& line);

// Encodes any bytes as UTF-8 for a JSON string.
std::string EncodeBytes(const std::string& bytes);

// Decodes a text of EncodeBytes.
std::string DecodeBytes(const std::string& text);

} // namespace assay_host
