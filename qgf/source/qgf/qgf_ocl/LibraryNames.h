// The platform's default names of the OpenCL loader library.
#pragma once

namespace QGF {
namespace OCL {

// File names in the order in which they are tried; the last entry is null.
extern const char* const kLibraryNames[];

} // namespace OCL
} // namespace QGF
