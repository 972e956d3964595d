// The bytes of a report's file, read on demand and within limits.
#pragma once

#include <cstddef>
#include <fstream>
#include <streambuf>
#include <string>
#include <vector>

namespace assay_host {

class ReportInput : public std::streambuf {
public:
    struct Limits {
        // The largest document of a report that keeps to its reader's limits is smaller.
        std::size_t fMaxBytes = std::size_t{64} << 20;
        // So is the longest string of such a document.
        std::size_t fMaxWordBytes = std::size_t{1} << 20;
    };

    // The path is UTF-8. Throws std::runtime_error if it can't be opened.
    explicit ReportInput(const std::string& path);
    ReportInput(const std::string& path, const Limits& limits);

    // The first line that isn't blank, up to `maxBytes`, if it begins with '{'; else empty. The
    // bytes are read again later. Call first.
    std::string PeekJsonLine(std::size_t maxBytes);

    // Treats the bytes as JSON: refuses a string or a number that is too long before a parser holds
    // it. Call before anything is read.
    void ExpectJson();

protected:
    // Throws std::runtime_error if the file can't be read, or goes beyond a limit.
    int_type underflow() override;

private:
    bool ReadBlock();
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
