// Paths as people type them, in UTF-8, and as the system takes them.
#pragma once

#include <string>

#include <boost/filesystem/path.hpp>

namespace assay_host {

boost::filesystem::path ToPath(const std::string& text);
std::string ToText(const boost::filesystem::path& path);

} // namespace assay_host
