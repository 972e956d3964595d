#include "output/Links.h"

#include <boost/filesystem/operations.hpp>

namespace assay_host {

boost::filesystem::path FollowLinks(boost::filesystem::path path)
{
    namespace fs = boost::filesystem;
    constexpr int kMaxLinks = 40; // the limit of Linux
    boost::system::error_code error;
    for (int links = 0; links < kMaxLinks; ++links) {
        if (fs::symlink_status(path, error).type() != fs::symlink_file)
            break;
        const fs::path target = fs::read_symlink(path, error);
        if (error)
            break;
        path = target.is_absolute() ? target : path.parent_path() / target;
    }
    return path;
}

boost::filesystem::path MakeTemporaryPath(const boost::filesystem::path& path)
{
    boost::filesystem::path name = ".";
    name += path.filename();
    name += boost::filesystem::unique_path(".%%%%%%%%.tmp");
    return path.parent_path() / name;
}

} // namespace assay_host
