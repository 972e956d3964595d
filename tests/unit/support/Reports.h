// Makes the reports of machines with any number of devices.
#pragma once

#include <string>
#include <vector>

#include "report/Report.h"
#include "report/ReportReader.h"
#include "report/RunOutcome.h"

namespace assay_host {

inline Report ReadReport(const std::string& text)
{
    ReportReader reader;
    Report report;
    report.Add(reader.Feed(text));
    report.Add(reader.Finish());
    return report;
}

inline Report ReadReport(const std::vector<std::string>& lines)
{
    std::string text;
    for (const std::string& line : lines)
        text += line + "\n";
    return ReadReport(text);
}

inline std::string GL(int device, const std::string& rest)
{
    return "glgpu[" + std::to_string(device) + "]." + rest;
}

inline std::string CL(int device, const std::string& rest)
{
    return "clgpu[" + std::to_string(device) + "]." + rest;
}

// Returns the lines of a run without failures in groups, one for each step, in order. Independent
// of the product's tables.
inline std::vector<std::vector<std::string>> MakeWholeRun(int glCount, int clCount)
{
    std::vector<std::vector<std::string>> run = {
        {},
        {"Tester=\"Pixmere\""},
        {"assayStart=\"2026-11-21_12:35:39\""},
        {"QGFCoreInitialized=1"},
        {"QGFOGLInitialized=1"},
        {"OGLContextCreated=1"},
        {"NumGLGPUs=" + std::to_string(glCount)},
    };
    for (const char* key :
         {"GLVersion=\"4.1\"", "IsIntegratedGLGPU=0", "GLMemoryMB=4096", "GLName=\"A card\"",
          "GLVendor=\"A vendor\"", "GLVendorID=4318", "GLDriverVersion=\"1.2\"",
          "GLRectTextureSize=16384", "GLRenderer=\"A renderer\"", "GLRendererID=5",
          "HasGLNPOTSupport=1", "GLDriver=\"driver\"", "GLDriverDate=\"?\"",
          "CanCompileProgramGLSL=1", "GLFrameBufferOK=1"})
        for (int device = 0; device < glCount; ++device)
            run.push_back({GL(device, key)});
    for (int device = 0; device < glCount; ++device)
        run.push_back({"gputag.GL_SHADING_LANGUAGE_VERSION=35724",
                       GL(device, "glGetString[GL_SHADING_LANGUAGE_VERSION]=\"4.50\"")});
    for (int device = 0; device < glCount; ++device)
        run.push_back({"gputag.GL_FRAGMENT_PROGRAM_ARB=34820",
                       "gputag.GL_MAX_PROGRAM_INSTRUCTIONS_ARB=34977",
                       GL(device, "glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB]"
                                  "[GL_MAX_PROGRAM_INSTRUCTIONS_ARB]=[1024]")});
    const std::vector<std::pair<const char*, int>> integers = {
        {"GL_MAX_TEXTURE_UNITS", 34018},
        {"GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS", 35661},
        {"GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS", 35660},
        {"GL_MAX_TEXTURE_IMAGE_UNITS", 34930},
        {"GL_MAX_DRAW_BUFFERS", 34852},
        {"GL_MAX_VERTEX_UNIFORM_COMPONENTS", 35658},
        {"GL_MAX_FRAGMENT_UNIFORM_COMPONENTS", 35657},
        {"GL_MAX_VARYING_FLOATS", 35659},
        {"GL_MAX_VERTEX_ATTRIBS", 34921}};
    for (const auto& [name, code] : integers) {
        for (int device = 0; device < glCount; ++device)
            run.push_back({std::string("gputag.") + name + "=" + std::to_string(code),
                           GL(device, std::string("glGetIntegerv[") + name + "]=[8]")});
    }
    const std::vector<std::pair<const char*, int>> extensions = {
        {"GL_ARB_VERTEX_PROGRAM", 69},       {"GL_ARB_FRAGMENT_PROGRAM", 27},
        {"GL_ARB_VERTEX_SHADER", 70},        {"GL_ARB_FRAGMENT_SHADER", 28},
        {"GL_EXT_FRAMEBUFFER_OBJECT", 81},   {"GL_ARB_TEXTURE_RECTANGLE", 58},
        {"GL_ARB_TEXTURE_FLOAT", 53},        {"GL_ARB_OCCLUSION_QUERY", 37},
        {"GL_ARB_VERTEX_BUFFER_OBJECT", 68}, {"GL_ARB_SHADER_TEXTURE_LOD", 47}};
    for (const auto& [name, number] : extensions) {
        for (int device = 0; device < glCount; ++device)
            run.push_back({std::string("gputag.QGF::OGL::") + name + "=" + std::to_string(number),
                           GL(device, std::string("extension[QGF::OGL::") + name + "]=1")});
    }
    if (clCount >= 0) {
        run.push_back({"NumCLGPUs=" + std::to_string(clCount)});
        for (const char* key :
             {"CLPlatformVersion=\"1.2\"", "CLDeviceVersion=\"1.2\"", "IsIntegratedCLGPU=0",
              "CLMemoryMB=4096", "CLName=\"A device\"", "CLVendor=\"A vendor\"", "CLVendorID=4318",
              "CLDriverVersion=\"390\"", "CUDASupported=0", "", "CLBandwidth=3.35544e+09",
              "CLCompute=32"}) {
            for (int device = 0; device < clCount; ++device) {
                run.emplace_back();
                if (*key != '\0')
                    run.back().push_back(CL(device, key));
            }
        }
    }
    run.push_back({"assayEnd=\"2026-11-21_12:35:40\""});
    run.emplace_back();
    return run;
}

inline std::vector<std::string> Join(const std::vector<std::vector<std::string>>& groups)
{
    std::vector<std::string> lines;
    for (const auto& group : groups)
        lines.insert(lines.end(), group.begin(), group.end());
    return lines;
}

inline RunOutcome MakeOutcome(int status, std::vector<std::string> errors = {})
{
    RunOutcome outcome;
    outcome.fExitStatus = status;
    outcome.fErrorLines = std::move(errors);
    return outcome;
}

} // namespace assay_host
