// The paths of an output file: the target of a symbolic link, and the temporary file beside it.
#pragma once

#include <boost/filesystem/path.hpp>

namespace assay_host {

// Returns the final target of a link, whether it exists or not; the path itself if it isn't a
// link. For a loop of links, returns one of them. Never throws. Any thread may call.
boost::filesystem::path FollowLinks(boost::filesystem::path path);

// Returns a new name in the same folder: ".NAME.1a2b3c4d.tmp". Programs that read all files of a
// folder leave out names that begin with a dot.
boost::filesystem::path MakeTemporaryPath(const boost::filesystem::path& path);

} // namespace assay_host
