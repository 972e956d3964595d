// Follows symbolic links, including dangling ones.
#pragma once

#include <boost/filesystem/path.hpp>

namespace assay_host {

// Returns the final target of a link, whether it exists or not, and the path itself if it isn't a
// link. For a loop of links, returns one of them. Never throws. Any thread may call.
boost::filesystem::path FollowLinks(boost::filesystem::path path);

} // namespace assay_host
