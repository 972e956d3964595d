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

// The program stands on the command line as it is given, and a path can't hold a quotation mark.
std::wstring ToProgram(const std::string& text)
{
    return L'"' + boost::nowide::widen(text) + L'"';
}

} // namespace assay_host
