#include "supervise/Paths.h"

#include <boost/nowide/convert.hpp>

namespace assay_host {

boost::filesystem::path ToPath(const std::string& text)
{
    return text;
}

std::string ToText(const boost::filesystem::path& path)
{
    return path.native();
}

std::wstring ToProgram(const std::string& text)
{
    return boost::nowide::widen(text);
}

} // namespace assay_host
