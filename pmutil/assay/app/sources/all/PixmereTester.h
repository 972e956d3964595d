// The tester of this program: the sequence with the tester's name, a battery of OpenGL constants
// and extensions, and the OpenCL compute figure.
#pragma once

#include "GPUAssayTester.h"

namespace assay {

class PixmereTester : public GPUAssayTester {
public:
    using GPUAssayTester::GPUAssayTester;
    ~PixmereTester() override;

    void DoRunStart() override;
    void DoRunGLTests() override;
    void DoRunCLTests() override;
    virtual void DoRunCLCompute(std::string tag, CLGPU& gpu);
};

} // namespace assay
