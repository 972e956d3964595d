// The trials of a device whose answer is 0 if it can't be used.
#pragma once

#include <algorithm>
#include <iterator>
#include <string_view>

namespace assay_host {

struct Trial {
    const char* fKey;  // without the device's tag
    const char* fCode; // a stable identifier of the failure
    const char* fText; // of the failure; part of a sentence
};

constexpr Trial kTrials[] = {
    {"CanCompileProgramGLSL", "shader-trial-failed",
     "a realistic pair of shaders does not compile and link"},
    {"GLFrameBufferOK", "framebuffer-trial-failed",
     "no complete framebuffer object could be created and drawn to"},
};

inline bool IsTrial(std::string_view key)
{
    return std::any_of(std::begin(kTrials), std::end(kTrials),
                       [key](const Trial& trial) { return key == trial.fKey; });
}

} // namespace assay_host
