// The probe implementation of the program: what GPUImplHardware answers, and the rest from the
// operating system's adapter lists. Its name tells the shape of those lists, not the platform.
#pragma once

#include <map>
#include <string>
#include <utility>
#include <vector>

#include "pmutil_gpu/DXGIData.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "pmutil_gpu/WMIData.h"

namespace pmutil {

using DeviceContext =
    std::pair<boost::shared_ptr<QGF::OGL::ContextOffscreen>, QGF::OGL::DisplayDeviceKey>;

// The contexts that could be made, by the device string of their display device.
using ContextsByDeviceString = std::map<std::string, DeviceContext>;

class GPUImplWin : public GPUImplHardware {
public:
    GPUImplWin();
    ~GPUImplWin() override;

    // Makes a context on each display device that takes one. Of several devices with one device
    // string the last one stays. A device that fails is skipped, with a line in the log and on
    // standard error.
    static ContextsByDeviceString CreateContexts();

    WMIData fWMI;
    DXGIData fDXGI;

private:
    GLGPUs DoGetGPUs() override;
    std::uint32_t DoGetGLMemoryMB() override;
    std::string DoGetGLName() override;
    std::uint32_t DoGetGLVendorID() override;
    std::string DoGetGLDriverVersion() override;
    std::uint32_t DoGetGLRendererID() override;
    std::string DoGetGLDriver() override;
    std::string DoGetGLDriverDate() override;
    std::string DoGetGLDriverExtra() override;
    bool DoIsIntegratedGLGPU() override;
};

using GPUImplWins = std::vector<boost::shared_ptr<GPUImplWin>>;

// The first of [first, last) whose OpenGL name equals `name` exactly, or `last`.
GPUImplWins::const_iterator FindImplByName(GPUImplWins::const_iterator first,
                                           GPUImplWins::const_iterator last,
                                           const std::string& name);

// Joins adapter records with the contexts that could be made: one implementation for each context
// that a record names, DXGI order first, then what only WMI knows. Records without a context are
// logged and dropped.
GPUImplWins JoinDevices(const ContextsByDeviceString& contexts,
                        const std::vector<DXGIData>& dxgiDevices,
                        const std::vector<WMIData>& wmiDevices);

} // namespace pmutil
