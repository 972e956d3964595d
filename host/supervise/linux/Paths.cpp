#include "supervise/Paths.h"

namespace assay_host {

boost::filesystem::path ToPath(const std::string& text)
{
    return text;
}

std::string ToText(const boost::filesystem::path& path)
{
    return path.native();
}

} // namespace assay_host
