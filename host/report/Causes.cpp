#include "report/Causes.h"

namespace assay_host {

namespace {

// The parts before a cause.
constexpr std::string_view kStarts[] = {
    "QGF::Core::Library::initialize() failed: ",
    "QGF::OGL::Library::initialize() failed: ",
    "Cannot create default ContextOffscreen: ",
    "DoCompileProgramGLSL: ",
    "DoGLFramebufferOK: ",
};

// A line with one of these parts is a cause as a whole.
constexpr std::string_view kParts[] = {
    ": glGetError() returns ",
    "GLGetIntegerv failure",
};

} // namespace

std::string FindCauseText(std::string_view text)
{
    for (const std::string_view start : kStarts)
        if (text.substr(0, start.size()) == start)
            return std::string(text.substr(start.size()));
    for (const std::string_view part : kParts)
        if (text.find(part) != std::string_view::npos)
            return std::string(text);
    return {};
}

} // namespace assay_host
