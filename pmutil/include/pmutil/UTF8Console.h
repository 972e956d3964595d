// A console that shows UTF-8.
#pragma once

namespace pmutil {

// On Windows, while it lives, the console behind standard output or standard error shows what is
// written to it as UTF-8; then, and when Ctrl-C or the like ends the process, the console gets its
// code page back. It keeps UTF-8 where the process crashes. Streams that go elsewhere are left
// alone, and other platforms need nothing. Standard output to a console is written when it is
// flushed. Make one at most, in main, before anything is written.
class UTF8Console {
public:
    UTF8Console();
    ~UTF8Console(); // NOLINT(performance-trivially-destructible): Windows has work here
    UTF8Console(const UTF8Console&) = delete;
    UTF8Console& operator=(const UTF8Console&) = delete;

    // For a process that ends without destroying it. Any thread, any number of times.
    static void PutBack();
};

} // namespace pmutil
