// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Switches the Windows console to UTF-8.
#pragma once

namespace pmutil {

// On Windows, sets the output code page of the console to UTF-8 if standard output or standard
// error is a console. The destructor, and the end of the process by Ctrl-C or a similar event,
// restore the code page; after a crash it stays UTF-8. Standard output to a console is buffered
// until a flush. Streams that aren't consoles are unchanged; on other platforms the class does
// nothing. Make at most one, in main, before the first output.
class UTF8Console {
public:
    UTF8Console();
    ~UTF8Console(); // NOLINT(performance-trivially-destructible): Windows has work here
    UTF8Console(const UTF8Console&) = delete;
    UTF8Console& operator=(const UTF8Console&) = delete;

    // Restores the code page before an exit that doesn't run the destructor. Any thread may call
    // it, any number of times.
    static void Restore();
};

} // namespace pmutil
