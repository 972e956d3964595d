// The common base class of the application and the tester.
#pragma once

namespace assay {

class GPUAssayAppAndHost {
public:
    GPUAssayAppAndHost() = default;
    virtual ~GPUAssayAppAndHost() = 0;
    GPUAssayAppAndHost(const GPUAssayAppAndHost&) = delete;
    GPUAssayAppAndHost& operator=(const GPUAssayAppAndHost&) = delete;
};

inline GPUAssayAppAndHost::~GPUAssayAppAndHost() = default;

} // namespace assay
