// One line of progress on standard error, written over and over; nothing where that is no terminal.
#pragma once

#include <cstddef>
#include <string>

namespace assay_host {

class ProgressLine {
public:
    ProgressLine();
    ~ProgressLine();
    ProgressLine(const ProgressLine&) = delete;
    ProgressLine& operator=(const ProgressLine&) = delete;

    void Show(std::string text);

    // Takes the line away, so that others can write.
    void Clear();

private:
    const bool fShows;
    std::size_t fLength = 0;
};

} // namespace assay_host
