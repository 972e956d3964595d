// Builds reports for tests.
#pragma once

#include <algorithm>
#include <string>
#include <vector>

namespace assay_host {

// A key and its value in the form of a report. The tables have the two devices of a machine with
// one card.
struct SampleValue {
    const char* fKey;
    const char* fValue;
};

constexpr SampleValue kSampleGL[] = {
    {"GLVersion", "\"4.1\""},
    {"IsIntegratedGLGPU", "0"},
    {"GLMemoryMB", "24564"},
    {"GLName", "\"Accelerator 4000\""},
    {"GLVendor", "\"Example Corporation\""},
    {"GLVendorID", "4318"},
    {"GLDriverVersion", "\"31.0.15.2802\""},
    {"GLRectTextureSize", "32768"},
    {"GLRenderer", "\"Accelerator 4000/PCIe/SSE2\""},
    {"GLRendererID", "9860"},
    {"HasGLNPOTSupport", "1"},
    {"GLDriver", "\"C:\\drivers\\example64.dll\""},
    {"GLDriverDate", "\"20230105000000.000000-000\""},
    {"CanCompileProgramGLSL", "1"},
    {"GLFrameBufferOK", "1"},
    {"glGetString[GL_SHADING_LANGUAGE_VERSION]", "\"4.60\""},
    {"glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][GL_MAX_PROGRAM_INSTRUCTIONS_ARB]", "[65536]"},
    {"glGetIntegerv[GL_MAX_TEXTURE_UNITS]", "[4]"},
    {"glGetIntegerv[GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS]", "[192]"},
    {"glGetIntegerv[GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS]", "[32]"},
    {"glGetIntegerv[GL_MAX_TEXTURE_IMAGE_UNITS]", "[32]"},
    {"glGetIntegerv[GL_MAX_DRAW_BUFFERS]", "[8]"},
    {"glGetIntegerv[GL_MAX_VERTEX_UNIFORM_COMPONENTS]", "[4096]"},
    {"glGetIntegerv[GL_MAX_FRAGMENT_UNIFORM_COMPONENTS]", "[4096]"},
    {"glGetIntegerv[GL_MAX_VARYING_FLOATS]", "[124]"},
    {"glGetIntegerv[GL_MAX_VERTEX_ATTRIBS]", "[16]"},
    {"extension[QGF::OGL::GL_ARB_VERTEX_PROGRAM]", "1"},
    {"extension[QGF::OGL::GL_ARB_FRAGMENT_PROGRAM]", "1"},
    {"extension[QGF::OGL::GL_ARB_VERTEX_SHADER]", "1"},
    {"extension[QGF::OGL::GL_ARB_FRAGMENT_SHADER]", "1"},
    {"extension[QGF::OGL::GL_EXT_FRAMEBUFFER_OBJECT]", "1"},
    {"extension[QGF::OGL::GL_ARB_TEXTURE_RECTANGLE]", "1"},
    {"extension[QGF::OGL::GL_ARB_TEXTURE_FLOAT]", "1"},
    {"extension[QGF::OGL::GL_ARB_OCCLUSION_QUERY]", "1"},
    {"extension[QGF::OGL::GL_ARB_VERTEX_BUFFER_OBJECT]", "1"},
    {"extension[QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD]", "0"},
};

constexpr SampleValue kSampleCL[] = {
    {"CLPlatformVersion", "\"3.0\""},
    {"CLDeviceVersion", "\"3.0 CUDA\""},
    {"IsIntegratedCLGPU", "0"},
    {"CLMemoryMB", "24564"},
    {"CLName", "\"Accelerator 4000\""},
    {"CLVendor", "\"Example Corporation\""},
    {"CLVendorID", "4318"},
    {"CLDriverVersion", "\"528.02\""},
    {"CUDASupported", "1"},
    {"CUDAVersion", "\"12.0.89\""},
    {"CLBandwidth", "8.34512e+11"},
    {"CLCompute", "1234.56"},
};

// Builds the report of a machine with several devices. It can be changed and truncated.
class Sample {
public:
    Sample(int glCount, int clCount) : fGLCount(glCount), fCLCount(clCount) {}

    // Changes the value of a key (with its tag). An empty value removes the line.
    Sample& Set(std::string key, std::string value)
    {
        fChanges.push_back({std::move(key), std::move(value)});
        return *this;
    }

    // Removes the device's lines from this key on.
    Sample& Fail(std::string tag, std::string key)
    {
        fFailures.push_back({std::move(tag), std::move(key)});
        return *this;
    }

    // Removes all lines after that of this key (with its tag).
    Sample& EndAfter(std::string key)
    {
        fLastKey = std::move(key);
        return *this;
    }

    std::string GetText()
    {
        fText.clear();
        fEnded = false;
        Add("Tester", "\"Pixmere\"");
        Add("assayStart", "\"2026-11-21_10:49:35\"");
        Add("QGFCoreInitialized", "1");
        Add("QGFOGLInitialized", "1");
        Add("OGLContextCreated", "1");
        Add("NumGLGPUs", std::to_string(fGLCount));
        AddDevices("glgpu", fGLCount, kSampleGL);
        if (fCLCount >= 0)
            Add("NumCLGPUs", std::to_string(fCLCount));
        AddDevices("clgpu", fCLCount, kSampleCL);
        Add("assayEnd", "\"2026-11-21_10:49:36\"");
        return fText;
    }

private:
    struct Item {
        std::string fKey;
        std::string fValue;
    };

    template <std::size_t kSize>
    void AddDevices(const char* word, int count, const SampleValue (&values)[kSize])
    {
        std::vector<bool> isFailed(static_cast<std::size_t>(std::max(count, 0)));
        for (const SampleValue& value : values) {
            for (std::size_t index = 0; index < isFailed.size(); ++index) {
                const std::string tag = word + ("[" + std::to_string(index) + "]");
                for (const Item& failure : fFailures)
                    if (failure.fKey == tag && failure.fValue == value.fKey)
                        isFailed[index] = true;
                if (!isFailed[index])
                    Add(tag + "." + value.fKey, value.fValue);
            }
        }
    }

    void Add(const std::string& key, std::string value)
    {
        for (const Item& change : fChanges)
            if (change.fKey == key)
                value = change.fValue;
        if (!fEnded && !value.empty())
            fText += key + "=" + value + "\n";
        fEnded = fEnded || key == fLastKey;
    }

    int fGLCount;
    int fCLCount; // less than 0: no OpenCL
    std::vector<Item> fChanges;
    std::vector<Item> fFailures;
    std::string fLastKey;
    std::string fText;
    bool fEnded = false;
};

} // namespace assay_host
