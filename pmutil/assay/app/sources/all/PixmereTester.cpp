#include "PixmereTester.h"

#include <utility>

#include "GPUTest.h"
#include "ReportLine.h"

namespace assay {

namespace {

using namespace QGF::OGL;

enum class Query { GLString, Programv, Integerv, Extension };

struct BatteryRow {
    Query query;
    const char* name;
    std::int32_t code;
};

constexpr BatteryRow kBattery[] = {
    {Query::GLString, "GL_SHADING_LANGUAGE_VERSION", 0x8B8C},
    {Query::Programv, "GL_MAX_PROGRAM_INSTRUCTIONS_ARB", 0x88A1},
    {Query::Integerv, "GL_MAX_TEXTURE_UNITS", 0x84E2},
    {Query::Integerv, "GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS", 0x8B4D},
    {Query::Integerv, "GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS", 0x8B4C},
    {Query::Integerv, "GL_MAX_TEXTURE_IMAGE_UNITS", 0x8872},
    {Query::Integerv, "GL_MAX_DRAW_BUFFERS", 0x8824},
    {Query::Integerv, "GL_MAX_VERTEX_UNIFORM_COMPONENTS", 0x8B4A},
    {Query::Integerv, "GL_MAX_FRAGMENT_UNIFORM_COMPONENTS", 0x8B49},
    {Query::Integerv, "GL_MAX_VARYING_FLOATS", 0x8B4B},
    {Query::Integerv, "GL_MAX_VERTEX_ATTRIBS", 0x8869},
    {Query::Extension, "QGF::OGL::GL_ARB_VERTEX_PROGRAM", GL_ARB_VERTEX_PROGRAM},
    {Query::Extension, "QGF::OGL::GL_ARB_FRAGMENT_PROGRAM", GL_ARB_FRAGMENT_PROGRAM},
    {Query::Extension, "QGF::OGL::GL_ARB_VERTEX_SHADER", GL_ARB_VERTEX_SHADER},
    {Query::Extension, "QGF::OGL::GL_ARB_FRAGMENT_SHADER", GL_ARB_FRAGMENT_SHADER},
    {Query::Extension, "QGF::OGL::GL_EXT_FRAMEBUFFER_OBJECT", GL_EXT_FRAMEBUFFER_OBJECT},
    {Query::Extension, "QGF::OGL::GL_ARB_TEXTURE_RECTANGLE", GL_ARB_TEXTURE_RECTANGLE},
    {Query::Extension, "QGF::OGL::GL_ARB_TEXTURE_FLOAT", GL_ARB_TEXTURE_FLOAT},
    {Query::Extension, "QGF::OGL::GL_ARB_OCCLUSION_QUERY", GL_ARB_OCCLUSION_QUERY},
    {Query::Extension, "QGF::OGL::GL_ARB_VERTEX_BUFFER_OBJECT", GL_ARB_VERTEX_BUFFER_OBJECT},
    {Query::Extension, "QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD", GL_ARB_SHADER_TEXTURE_LOD},
};

void RunRow(GPUAssayTester& tester, GPUEntries& entries, const BatteryRow& row)
{
    constexpr std::uint64_t kCount = 1;
    switch (row.query) {
    case Query::GLString:
        return tester.RunTest(entries, GLStringTest(row.name, row.code));
    case Query::Programv:
        return tester.RunTest(entries, ProgramvTest(row.name, row.code, kCount));
    case Query::Integerv:
        return tester.RunTest(entries, IntegervTest(row.name, row.code, kCount));
    case Query::Extension:
        return tester.RunTest(entries, ExtensionTest(row.name, row.code));
    }
}

} // namespace

PixmereTester::~PixmereTester() = default;

void PixmereTester::DoRunStart()
{
    GPUAssayTester::Step();
    Report(TextLine("Tester", "Pixmere"));
}

void PixmereTester::DoRunGLTests()
{
    GPUAssayTester::DoRunGLTests();
    GPUEntries entries = fGLGPUs;
    const std::size_t size = entries.size();
    if (!entries.empty())
        for (const BatteryRow& row : kBattery)
            RunRow(*this, entries, row);
    if (entries.size() != size)
        fGLGPUs = entries;
}

void PixmereTester::DoRunCLTests()
{
    GPUAssayTester::DoRunCLTests();
    GPUEntries entries = fCLGPUs;
    const std::size_t size = entries.size();
    if (!entries.empty())
        RunTest(entries, TestFunc<PixmereTester, CLGPU>(&PixmereTester::DoRunCLCompute));
    if (entries.size() != size)
        fCLGPUs = entries;
}

void PixmereTester::DoRunCLCompute(std::string tag, CLGPU& gpu)
{
    Report(ValueLine(TaggedKey(std::move(tag), "CLCompute"), gpu.impl->GetCLCompute()));
}

} // namespace assay
