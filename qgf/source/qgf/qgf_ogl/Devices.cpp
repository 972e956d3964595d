#include "qgf/qgf_ogl/Devices.h"

#include <utility>

namespace QGF {
namespace OGL {

namespace {

struct State {
    std::unique_ptr<Platform> platform;
    std::vector<DisplayDeviceKey> devices;
    bool devicesKnown = false;
};

// Never destroyed: at process exit drivers shut down in an unknown order, and must not be called
// afterwards.
State& GetState()
{
    static auto* const state = new State;
    return *state;
}

} // namespace

Platform& CurrentPlatform()
{
    State& state = GetState();
    if (!state.platform)
        state.platform = MakeNativePlatform();
    return *state.platform;
}

const std::vector<DisplayDeviceKey>& DisplayDevices()
{
    State& state = GetState();
    if (!state.devicesKnown) {
        state.devices = CurrentPlatform().displayDevices();
        state.devicesKnown = true;
    }
    return state.devices;
}

void ReplacePlatform(std::unique_ptr<Platform> platform)
{
    State& state = GetState();
    state.devices.clear();
    state.devicesKnown = false;
    state.platform = std::move(platform);
}

void Library::Initialize(const InitOptions&)
{
    Context::PrimaryDisplayDevice();
}

DisplayDeviceKey Context::PrimaryDisplayDevice()
{
    for (const DisplayDeviceKey& key : DisplayDevices())
        if (!key.deviceName().empty())
            return key;
    throw LogicalException("OpenGL has no display device on this machine");
}

int Context::NumDisplayDevice()
{
    try {
        return static_cast<int>(DisplayDevices().size());
    } catch (const LogicalException&) {
        return 0;
    }
}

bool Context::DisplayDevice(int index, DisplayDeviceKey& key)
{
    if (index < 0 || index >= NumDisplayDevice())
        return false;
    const DisplayDeviceKey& found = DisplayDevices()[static_cast<std::size_t>(index)];
    if (found.deviceName().empty())
        return false;
    key = found;
    return true;
}

} // namespace OGL
} // namespace QGF
