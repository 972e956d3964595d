#include "app/NeedStatus.h"

namespace assay_host {

int GetNeedStatus(Need need, Usability opengl, Usability opencl)
{
    return GetUsabilityStatus(need == Need::kOpenGL   ? opengl
                              : need == Need::kOpenCL ? opencl
                                                      : GetLesser(opengl, opencl));
}

} // namespace assay_host
