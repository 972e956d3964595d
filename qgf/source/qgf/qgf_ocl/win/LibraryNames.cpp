#include "qgf/qgf_ocl/LibraryNames.h"

namespace QGF {
namespace OCL {

const char* const kLibraryNames[] = {"OpenCL.dll", nullptr};

} // namespace OCL
} // namespace QGF
