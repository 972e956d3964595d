// Advice as variables of a shell, compared as a whole.
#include "memory/AdviceForms.h"

#include <gtest/gtest.h>

#include "Samples.h"

namespace assay_host {
namespace {

TEST(AdviceVariables, AreThoseOfBothInterfaces)
{
    Advice advice;
    advice.fTime = kNow;
    advice.fName = "5a0a2f38-0000-5000-8000-000000000000";
    advice.fCount = 3;
    advice.fTried = true;
    advice.fOpenGL.fOutlook.fFinding = MakeFinding(Usability::kHardware, "trials-passed");
    advice.fOpenGL.fOutlook.fTime = kNow - 61;
    advice.fOpenGL.fOutlook.fNextTime = kNow + Policy::kDay;
    advice.fOpenGL.fOutlook.fWarning = "It's old.";
    advice.fOpenGL.fEnd = AttemptEnd::kEnded;
    advice.fOpenCL.fOutlook.fFinding = MakeFinding(Usability::kBroken, "crashed");
    advice.fOpenCL.fOutlook.fTime = kNow;
    advice.fOpenCL.fOutlook.fFailures = 2;
    advice.fOpenCL.fEnd = AttemptEnd::kCrashed;
    advice.fOpenCL.fLastLine = "# clFinish";
    advice.fOpenCL.fIsLast = true;
    EXPECT_EQ(MakeAdviceVariables(advice), R"(ASSAY_OPENGL='hardware'
ASSAY_OPENGL_REASON='trials-passed'
ASSAY_OPENGL_TEXT='A sentence.'
ASSAY_OPENGL_SOURCE='memory'
ASSAY_OPENGL_LEARNT='hardware'
ASSAY_OPENGL_DEVICE='A card'
ASSAY_OPENGL_DRIVER='1.2'
ASSAY_OPENGL_END='ended'
ASSAY_OPENGL_LAST_LINE=''
ASSAY_OPENGL_AGE='61'
ASSAY_OPENGL_FAILURES='0'
ASSAY_OPENGL_NEXT='2027-01-16T08:00:00Z'
ASSAY_OPENGL_WARNING='It'\''s old.'
ASSAY_OPENGL_CHANGE='The next attempt is due at 2027-01-16T08:00:00Z, or if a fresh one is requested.'
ASSAY_OPENCL='broken'
ASSAY_OPENCL_REASON='crashed'
ASSAY_OPENCL_TEXT='A sentence.'
ASSAY_OPENCL_SOURCE='attempt'
ASSAY_OPENCL_LEARNT='broken'
ASSAY_OPENCL_DEVICE='A card'
ASSAY_OPENCL_DRIVER='1.2'
ASSAY_OPENCL_END='crashed'
ASSAY_OPENCL_LAST_LINE='# clFinish'
ASSAY_OPENCL_AGE='0'
ASSAY_OPENCL_FAILURES='2'
ASSAY_OPENCL_NEXT=''
ASSAY_OPENCL_WARNING=''
ASSAY_OPENCL_CHANGE='The next call makes an attempt.'
ASSAY_ATTEMPTS='3'
ASSAY_PLAN='answer'
ASSAY_TRIED='1'
)");
}

} // namespace
} // namespace assay_host
