#include "report/Activity.h"

#include <algorithm>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/LineForm.h"

namespace assay_host {

namespace {

struct Activity {
    std::string_view fKey; // without a device's tag
    const char* fText;
};

// The keys of all other lines are facts of a device.
constexpr Activity kActivities[] = {
    {"Tester", "starting"},
    {"assayStart", "starting"},
    {"QGFCoreInitialized", "initializing the graphics library"},
    {"QGFOGLInitialized", "loading OpenGL"},
    {"OGLContextCreated", "creating a first OpenGL context"},
    {"NumGLGPUs", "creating an OpenGL context on each display device"},
    {"CanCompileProgramGLSL", "compiling shaders"},
    {"GLFrameBufferOK", "drawing to a framebuffer"},
    {"NumCLGPUs", "loading OpenCL and listing its devices"},
    {"CLBandwidth", "measuring the copy bandwidth"},
    {"CLCompute", "measuring the compute speed"},
    {"assayEnd", "ending the tests"},
};

} // namespace

std::string GetActivityText(std::string_view next)
{
    const auto tag = GetDeviceTag(next);
    const std::string_view key = tag ? next.substr(tag->size() + 1) : next;
    const auto found = std::find_if(std::begin(kActivities), std::end(kActivities),
                                    [key](const Activity& each) { return each.fKey == key; });
    return fmt::format("{} ({})",
                       found == std::end(kActivities) ? "reading facts of a device" : found->fText,
                       ShowBytes(next));
}

} // namespace assay_host
