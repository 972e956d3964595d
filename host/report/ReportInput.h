// A report's file as a stream buffer that enforces limits.
#pragma once

#include <cstddef>
#include <fstream>
#include <streambuf>
#include <string>
#include <vector>

namespace assay_host {

// One thread at a time.
class ReportInput : public std::streambuf {
public:
    // Any document of a report that ReportReader accepts is within these.
    struct Limits {
        std::size_t fMaxBytes = std::size_t{64} << 20;    // of the file
        std::size_t fMaxWordBytes = std::size_t{1} << 20; // of a string or a number in JSON
    };

    // Opens the file; the path is UTF-8. Throws std::runtime_error with the text "can't open:
    // REASON".
    explicit ReportInput(const std::string& path);
    ReportInput(const std::string& path, const Limits& limits);

    // Returns the first line that isn't blank, or its first `maxBytes`, if it begins with '{';
    // otherwise an empty text. Doesn't consume any bytes. Call before anything is read. Throws as
    // underflow() does.
    std::string PeekJsonLine(std::size_t maxBytes);

    // Applies fMaxWordBytes from now on, so that a parser never holds a longer string or number.
    // Call before anything is read. Throws as underflow() does.
    void ExpectJson();

protected:
    // Throws std::runtime_error with the text "can't read: REASON", or "too large for a report" if
    // a limit is exceeded.
    int_type underflow() override;

private:
    bool ReadBlock(); // appends to fBlock; false at the end of the file
    void CheckWords();

    const Limits fLimits;
    std::ifstream fFile;
    std::vector<char> fBlock;
    std::size_t fBytes = 0;
    bool fIsJson = false;
    bool fIsInString = false;
    bool fIsEscaped = false;
    std::size_t fWordBytes = 0;
};

} // namespace assay_host
