// The conversion of wide paths to the narrow paths of the C library.
#pragma once

#include <boost/filesystem/path.hpp>

namespace pmutil {

// Returns the platform's conversion between wide and narrow path characters. Unlike Boost's default
// it reads no environment variable. On Windows, a path that the code page of the narrow calls can't
// represent is an error.
const boost::filesystem::path::codecvt_type& GetPathCodecvt();

} // namespace pmutil
