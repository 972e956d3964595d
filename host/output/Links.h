// Symbolic links, also dangling ones.
#pragma once

#include <boost/filesystem/path.hpp>

namespace assay_host {

// The final target of a link, whether it exists or not; the path itself if it is no link. For a
// loop of links, one of the links.
boost::filesystem::path FollowLinks(boost::filesystem::path path);

} // namespace assay_host
