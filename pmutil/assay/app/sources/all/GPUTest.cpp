#include "GPUTest.h"

namespace assay {

namespace {

pmutil::GLGPU& GLDevice(const GPUEntry& entry)
{
    return dynamic_cast<pmutil::GLGPU&>(*entry.gpu);
}

} // namespace

void GLStringTest::Run(GPUAssayTester& tester, const GPUEntry& entry) const
{
    tester.DoRunGLGetString(entry.tag, GLDevice(entry), name, code);
}

void IntegervTest::Run(GPUAssayTester& tester, const GPUEntry& entry) const
{
    tester.DoRunGLGetIntegerv(entry.tag, GLDevice(entry), name, code, count);
}

void ProgramvTest::Run(GPUAssayTester& tester, const GPUEntry& entry) const
{
    tester.DoRunGLGetProgramivARB(entry.tag, GLDevice(entry), name, code, count);
}

void ExtensionTest::Run(GPUAssayTester& tester, const GPUEntry& entry) const
{
    tester.DoRunExtension(entry.tag, GLDevice(entry), name, id);
}

} // namespace assay
