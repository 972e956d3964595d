// How wide paths become the narrow ones that the C library takes.
#pragma once

#include <boost/filesystem/path.hpp>

namespace pmutil {

// The platform's conversion between wide and narrow path characters. It asks no environment
// variable for a locale, which Boost's own default does. On Windows a path that the code page of
// the narrow calls can't represent is an error, and not another path.
const boost::filesystem::path::codecvt_type& GetPathCodecvt();

} // namespace pmutil
