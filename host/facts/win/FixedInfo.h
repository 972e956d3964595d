// Reads the fixed part of a file's version resource.
#pragma once

#include <optional>
#include <string>

#include <windows.h>

namespace assay_host {

// Returns nothing if the file can't be read or has none. Runs nothing of the file. The path is
// UTF-8. Any thread may call.
std::optional<VS_FIXEDFILEINFO> ReadFixedInfo(const std::string& path);

} // namespace assay_host
