// Symbolic links, also those that lead nowhere.
#pragma once

#include <boost/filesystem/path.hpp>

namespace assay_host {

// Where a link leads in the end, whether that exists or not; the path itself if it is no link. Of
// links in a circle it is one of them.
boost::filesystem::path FollowLinks(boost::filesystem::path path);

} // namespace assay_host
