// Logs the files that OpenGL and OpenCL load, so that a host learns which drivers were used, even
// if one of them crashes or hangs afterwards.
//
// A file belongs to a driver if it is loaded in a call into the libraries of OpenGL or OpenCL, or
// in the loading of these. What the process has before the first of these calls, and what it loads
// between them, isn't logged. Each file is logged once, after the call that loaded it:
//
//   loaded for OpenGL: /lib/x86_64-linux-gnu/libEGL.so.1
//
// The path is the dynamic loader's, which may be a symbolic link; on Windows it is UTF-8.
#pragma once

#include <cstdint>

namespace pmutil {

// The bit of the value of "GPUAssay" that adds these lines to the log.
constexpr std::int32_t kLogDriverFiles = 0x100;

// Begins, with a line "driver files are logged". Does nothing if the value of "GPUAssay" isn't
// positive or doesn't have the bit, or after an earlier call. Call it on the thread that calls the
// drivers, before the first call. Throws only std::bad_alloc.
void LogDriverFiles();

} // namespace pmutil
