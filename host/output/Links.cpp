#include "output/Links.h"

#include <boost/filesystem/operations.hpp>

namespace assay_host {

boost::filesystem::path FollowLinks(boost::filesystem::path path)
{
    namespace fs = boost::filesystem;
    constexpr int kMaxLinks = 40; // as many as Linux follows
    boost::system::error_code error;
    for (int links = 0; links < kMaxLinks; ++links) {
        if (fs::symlink_status(path, error).type() != fs::symlink_file)
            break;
        const fs::path target = fs::read_symlink(path, error);
        if (error)
            break;
        path = path.parent_path() / target; // the target alone if that is absolute
    }
    return path;
}

} // namespace assay_host
