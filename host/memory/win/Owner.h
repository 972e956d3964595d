// Whose a file is.
#pragma once

#include <string>

#include <windows.h>

namespace assay_host {

// Whether files of this owner may be used: the user of this process, the owner that its new files
// get, the group of the administrators, and the system. The last two can change any file.
bool IsTrustedOwner(PSID owner);

// Returns why the open file or folder must not be used: "it belongs to another user", or the
// system's text if its owner can't be read; empty if it may. The handle needs READ_CONTROL, which
// GENERIC_READ and GENERIC_WRITE have.
std::string CheckOwner(HANDLE file);

} // namespace assay_host
