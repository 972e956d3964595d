// The program's implementation of GPUImpl: adds to GPUImplHardware the queries that need the
// operating system's adapter lists. It is used on all platforms; the name refers to the structures
// of those lists.
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

// Contexts by the device string of their display device.
using ContextsByDeviceString = std::map<std::string, DeviceContext>;

class GPUImplWin : public GPUImplHardware {
public:
    GPUImplWin();
    ~GPUImplWin() override;

    // Makes a context on each display device. If several devices have the same device string, the
    // last one is kept. A device on which it fails is skipped, with a line in the log and on
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

// Returns the first of [first, last) whose OpenGL name equals `name`, or `last`.
GPUImplWins::const_iterator FindImplByName(GPUImplWins::const_iterator first,
                                           GPUImplWins::const_iterator last,
                                           const std::string& name);

// Joins adapter records with contexts by name. Returns one implementation for each DXGI name that
// has a context, in the order of `dxgiDevices`, then one for each WMI record that has a context but
// no DXGI record. Records without a context are logged and dropped.
GPUImplWins JoinDevices(const ContextsByDeviceString& contexts,
                        const std::vector<DXGIData>& dxgiDevices,
                        const std::vector<WMIData>& wmiDevices);

} // namespace pmutil
