// The style and the script of a page: the files page.css and copy.js, which the build puts into the
// program.
#pragma once

#include <string_view>

namespace assay_host {

extern const std::string_view kPageStyle;
extern const std::string_view kCopyScript;

// The script's hash for a content security policy: "sha256-" and the SHA-256 in base64.
extern const std::string_view kCopyScriptHash;

} // namespace assay_host
