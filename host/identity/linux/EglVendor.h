// Reads the file that names an EGL driver.
#pragma once

#include <string>

namespace assay_host {

// Returns the name or path of the library in the text of such a file: "library_path" of "ICD" in a
// JSON object. Empty if it has none. Throws only std::bad_alloc. Any thread may call.
std::string FindEglLibrary(const std::string& text);

} // namespace assay_host
