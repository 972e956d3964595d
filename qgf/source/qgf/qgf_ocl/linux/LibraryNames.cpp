#include "qgf/qgf_ocl/LibraryNames.h"

namespace QGF {
namespace OCL {

// The bare name comes with development files only.
const char* const kLibraryNames[] = {"libOpenCL.so.1", "libOpenCL.so", nullptr};

} // namespace OCL
} // namespace QGF
