// Texts about a run that the forms for people share. All are safe to write to a terminal. Any
// thread may call.
#pragma once

#include <string>
#include <vector>

#include "report/Answers.h"
#include "report/Report.h"
#include "report/RunOutcome.h"
#include "report/Usable.h"

namespace assay_host {

// Returns what a run came to, in a few words, such as "all tests ran". A whole run says nothing
// about what works.
std::string GetRunText(const Report& report, const RunOutcome& outcome);

// Returns what ended the child if it didn't end by itself: a signal, a code, or assay-host. Empty
// otherwise.
std::string GetEndText(const RunOutcome& outcome);

// Returns the child's path and options, separated by blanks.
std::string GetCommandText(const RunOutcome& outcome);

// Returns a text such as "hardware (glgpu[0]): OpenGL works on graphics hardware."
std::string GetUsableText(const Usable& usable);

// Returns a text such as "0.12 s (limit 60 s)": the time that the child took, and its limit if it
// had one.
std::string GetTimeText(const RunOutcome& outcome);

// Returns a text such as "2 OpenGL, no OpenCL graphics device".
std::string GetCountText(const Answers& answers);

// Returns the lines that aren't part of a report, as they came.
std::vector<std::string> GetRawLines(const Report& report);

} // namespace assay_host
