// Converts paths between UTF-8 and the system's encoding. Any thread may call.
#pragma once

#include <string>

#include <boost/filesystem/path.hpp>

namespace assay_host {

// Converts from UTF-8. On Linux the bytes are unchanged.
boost::filesystem::path ToPath(const std::string& text);

// Converts to UTF-8. On Linux the bytes are unchanged.
std::string ToText(const boost::filesystem::path& path);

} // namespace assay_host
