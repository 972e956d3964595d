// What this program's own streams are.
#pragma once

namespace assay_host {

bool IsErrorTerminal();

// The columns of the terminal behind standard output, or what is usual where there is none.
int GetOutputWidth();

// The same for standard error.
int GetErrorWidth();

} // namespace assay_host
