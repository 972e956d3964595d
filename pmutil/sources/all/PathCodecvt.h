// How wide paths become the narrow ones that the C library takes.
#pragma once

#include <boost/filesystem/path.hpp>

namespace pmutil {

// The platform's conversion between wide and narrow path characters. It asks no environment
// variable for a locale, which Boost's own default does.
const boost::filesystem::path::codecvt_type& GetPathCodecvt();

} // namespace pmutil
