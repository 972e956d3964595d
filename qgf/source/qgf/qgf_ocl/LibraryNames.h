// Where an OpenCL loader library is to be found when nobody names one.
#pragma once

namespace QGF {
namespace OCL {

// File names in the order of trying; ends with a null pointer.
extern const char* const kLibraryNames[];

} // namespace OCL
} // namespace QGF
