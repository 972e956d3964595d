// The JSON form of a run: one stable document, and the events of the JSON Lines form.
//
// A JSON text is Unicode and a driver's bytes need not be. Bytes that aren't part of well-formed
// UTF-8 stand as U+F780 to U+F7FF, a private range: 0xF700 plus the byte. A real character of that
// range is written the same way, byte by byte, so the way back is exact.
#pragma once

#include <istream>
#include <ostream>
#include <string>
#include <vector>

#include "report/Report.h"
#include "report/RunOutcome.h"

namespace assay_host {

// Raised when the document's form changes in a way that a reader must know of.
constexpr int kSchemaVersion = 1;

// Writes the document piece by piece, and a line end after it.
void WriteDocument(std::ostream& out, const Report& report, const RunOutcome& outcome);

// Events, each an object on one line, with its line end. It has "event" and "seconds" (since the
// launch).
std::string MakeStartEvent(const std::vector<std::string>& command);
std::string MakeLineEvent(const ReportLine& line, double seconds);
std::string MakeErrorLineEvent(const std::string& line, double seconds);
std::string MakeEndEvent(const RunOutcome& outcome);

// Reads the report from its document, and holds only the report's part of it. Throws
// std::runtime_error with what is wrong with the document.
Report ReadDocument(std::istream& text);

// The report back from the lines of the JSON Lines form. A last line that breaks off, as a host
// that died leaves it, is left out. Throws std::runtime_error with what is wrong with the events.
Report ReadEvents(std::istream& text);

// Whether the line is an event of the JSON Lines form, well-formed or not.
bool IsEvent(const std::string& line);

// Any bytes as a valid JSON string, and back.
std::string EncodeBytes(const std::string& bytes);
std::string DecodeBytes(const std::string& text);

} // namespace assay_host
