// The devices that a script describes, as the EGL and the OpenGL half of the scripted driver see
// them. Read once, at the driver's first call, from the file that ASSAY_SCRIPTED_EGL names; without
// that there is one device with the defaults.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "common/Script.h"

namespace scripted {

// A text by its EGL or OpenGL name; an entry without a text stands for a null pointer.
using Texts = std::map<std::int64_t, std::optional<std::string>>;

struct Device {
    Texts deviceTexts;  // eglQueryDeviceStringEXT
    Texts displayTexts; // eglQueryString
    Texts glTexts;      // glGetString; GL_EXTENSIONS is also what glGetStringi indexes
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
    std::vector<std::string> absent; // entry points that the driver hasn't got
    Monitor monitor;
};

Model& TheModel();

// The number of an EGL or OpenGL name that scripts may use in the place of a number.
std::optional<std::int64_t> NumberOf(const std::string& name);

// True if the blank-separated list holds the word.
bool HoldsWord(const std::string& list, const std::string& word);

} // namespace scripted
