// The file that the library is in.
#pragma once

#include <boost/filesystem/path.hpp>

namespace assay_host {

// Returns the file that this code is in: the shared library, or the program that it is linked into.
// Empty if the system doesn't report it. Any thread may call.
boost::filesystem::path GetOwnFile();

// Keeps a shared library loaded until the process ends: a thread of a run that was given up may
// still be in it. Any thread may call. On Linux it is linked so.
void KeepLoaded();

} // namespace assay_host
