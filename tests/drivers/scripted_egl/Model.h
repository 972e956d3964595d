// The devices that a script describes, for the driver's EGL and OpenGL halves. The driver's first
// call reads the file that ASSAY_SCRIPTED_EGL names; without it there is one default device.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "common/Script.h"

namespace scripted {

// Texts by EGL or OpenGL name; nullopt stands for a null pointer.
using Texts = std::map<std::int64_t, std::optional<std::string>>;

struct Device {
    Texts deviceTexts;  // eglQueryDeviceStringEXT
    Texts displayTexts; // eglQueryString
    Texts glTexts;      // glGetString; glGetStringi splits GL_EXTENSIONS
    std::map<std::int64_t, std::vector<std::int32_t>> integers;      // glGetIntegerv
    std::map<std::int64_t, std::vector<std::int32_t>> programLimits; // glGetProgramivARB
    std::optional<std::string> vertexLog;   // set: the vertex shader doesn't compile
    std::optional<std::string> fragmentLog; // set: the fragment shader doesn't compile
    std::optional<std::string> linkLog;     // set: programs don't link
};

struct Model {
    std::optional<std::string> clientExtensions;
    int defaultDevice = 0;
    std::int32_t eglMajor = 1;
    std::int32_t eglMinor = 5;
    std::vector<Device> devices;
    std::vector<std::string> absent; // entry points that the driver lacks
    Monitor monitor;
};

Model& GetModel();

// Returns the number of an EGL or OpenGL name that scripts may use instead of a number.
std::optional<std::int64_t> NumberOf(const std::string& name);

// Returns whether the blank-separated list has the word.
bool HoldsWord(const std::string& list, const std::string& word);

} // namespace scripted
