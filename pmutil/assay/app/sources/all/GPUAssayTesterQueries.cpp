// Queries of named constants, each with the "gputag" lines of its names.
#include <stdexcept>
#include <utility>
#include <vector>

#include "GPUAssayTester.h"
#include "ReportLine.h"

namespace assay {

namespace {

constexpr std::int32_t kFragmentProgram = 0x8804; // GL_FRAGMENT_PROGRAM_ARB

std::string CodeLine(const char* name, std::int32_t code)
{
    return ValueLine(TaggedKey("gputag", name), code);
}

// Returns "[1, 2, 3]". The opening bracket is written with the first value: an empty list is "]".
std::string ListText(const std::vector<std::int32_t>& values)
{
    std::ostringstream list;
    const char* separator = "[";
    for (const std::int32_t value : values) {
        list << separator << value;
        separator = ", ";
    }
    list << "]";
    return list.str();
}

} // namespace

void GPUAssayTester::DoRunGLGetString(std::string tag, GLGPU& gpu, const char* name,
                                      std::int32_t code)
{
    Print(CodeLine(name, code));
    const char* const text = gpu.impl->GLGetString(static_cast<std::uint32_t>(code));
    if (text == nullptr)
        throw std::logic_error(std::string("glGetString returns no text for ") + name);
    Print(TextLine(IndexedKey(std::move(tag), "glGetString", name), text));
}

void GPUAssayTester::DoRunGLGetIntegerv(std::string tag, GLGPU& gpu, const char* name,
                                        std::int32_t code, std::uint64_t count)
{
    std::vector<std::int32_t> values(count);
    gpu.impl->GLGetIntegerv(static_cast<std::uint32_t>(code), values.data());
    Print(CodeLine(name, code));
    Report(ValueLine(IndexedKey(std::move(tag), "glGetIntegerv", name), ListText(values)));
}

void GPUAssayTester::DoRunGLGetProgramivARB(std::string tag, GLGPU& gpu, const char* name,
                                            std::int32_t code, std::uint64_t count)
{
    std::vector<std::int32_t> values(count);
    Print(CodeLine("GL_FRAGMENT_PROGRAM_ARB", kFragmentProgram));
    Print(CodeLine(name, code));
    gpu.impl->GLGetProgramivARB(kFragmentProgram, static_cast<std::uint32_t>(code), values.data());
    const std::string key =
        IndexedKey(std::move(tag), "glGetProgramivARB", "GL_FRAGMENT_PROGRAM_ARB") + "[" + name +
        "]";
    Report(ValueLine(key, ListText(values)));
}

void GPUAssayTester::DoRunExtension(std::string tag, GLGPU& gpu, const char* name, std::int32_t id)
{
    Print(CodeLine(name, id));
    const bool supported =
        gpu.impl->GLIsExtensionSupported(static_cast<QGF::OGL::OpenGLExtension>(id));
    Report(ValueLine(IndexedKey(std::move(tag), "extension", name), supported));
}

} // namespace assay
