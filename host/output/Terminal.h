// Properties of the terminal behind this program's standard streams. Any thread may call.
#pragma once

namespace assay_host {

// Whether standard input is a terminal.
bool IsInputTerminal();

// Whether standard error is a terminal.
bool IsErrorTerminal();

// Returns the number of columns of the terminal behind standard output; 80 if there is none.
int GetOutputWidth();

// The same for standard error.
int GetErrorWidth();

} // namespace assay_host
