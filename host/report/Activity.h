// What the child does before it prints a line of its report.
#pragma once

#include <string>
#include <string_view>

namespace assay_host {

// Returns a part of a sentence, safe to write to a terminal: "compiling shaders
// (glgpu[0].CanCompileProgramGLSL)". `next`: a key as SequenceReader::GetNextKey() returns it, not
// empty. Any thread may call.
std::string GetActivityText(std::string_view next);

} // namespace assay_host
