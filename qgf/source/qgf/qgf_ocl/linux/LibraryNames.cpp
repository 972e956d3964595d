#include "qgf/qgf_ocl/LibraryNames.h"

namespace QGF {
namespace OCL {

// Only development packages have the second name.
const char* const kLibraryNames[] = {"libOpenCL.so.1", "libOpenCL.so", nullptr};

} // namespace OCL
} // namespace QGF
