#include "supervise/Paths.h"

#include <boost/nowide/convert.hpp>

namespace assay_host {

boost::filesystem::path ToPath(const std::string& text)
{
    return boost::nowide::widen(text);
}

std::string ToText(const boost::filesystem::path& path)
{
    return boost::nowide::narrow(path.native());
}

} // namespace assay_host
