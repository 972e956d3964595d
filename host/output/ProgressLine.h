// One line of progress on standard error, overwritten in place. Prints nothing if standard error
// isn't a terminal.
#pragma once

#include <cstddef>
#include <string>

namespace assay_host {

// One thread at a time.
class ProgressLine {
public:
    ProgressLine();
    ~ProgressLine(); // clears the line
    ProgressLine(const ProgressLine&) = delete;
    ProgressLine& operator=(const ProgressLine&) = delete;

    // Replaces the line. The text is cut at the width of the terminal; what isn't printable ASCII
    // shows as '?'.
    void Show(std::string text);

    // Erases the line, so that other text can be written.
    void Clear();

private:
    const bool fShows;
    std::size_t fLength = 0; // of the line shown
};

} // namespace assay_host
