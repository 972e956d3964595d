// The tester of this program: adds to the sequence the tester's name, a battery of OpenGL constants
// and extensions, and the OpenCL compute score.
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
