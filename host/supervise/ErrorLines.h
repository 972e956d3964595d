// Splits a child's standard error into lines.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

// One thread at a time.
class ErrorLines {
public:
    // Bytes beyond these limits are dropped and counted.
    static constexpr std::uint64_t kMaxBytes = std::uint64_t{1} << 20;
    static constexpr std::size_t kMaxLineBytes = std::size_t{1} << 16;
    static constexpr std::size_t kMaxLines = 10000;

    // Returns the lines that these bytes complete, without "\n" or "\r\n".
    std::vector<std::string> Feed(std::string_view bytes);

    // Call at the end of the data. Returns the last line if it has no end.
    std::vector<std::string> Finish();

    // Returns the number of bytes dropped so far.
    std::uint64_t GetLostByteCount() const { return fLost; }

private:
    void Hold(std::string_view piece);
    void EndLine(std::vector<std::string>& lines);

    std::uint64_t fBytes = 0;
    std::uint64_t fLost = 0;
    std::size_t fLines = 0;
    std::string fLine;
};

} // namespace assay_host
