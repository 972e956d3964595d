// Standard error of a child as lines, within limits.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

class ErrorLines {
public:
    static constexpr std::uint64_t kMaxBytes = std::uint64_t{1} << 20;
    static constexpr std::size_t kMaxLineBytes = std::size_t{1} << 16;
    static constexpr std::size_t kMaxLines = 10000;

    // The lines that these bytes complete, without their ends.
    std::vector<std::string> Feed(std::string_view bytes);

    // A last line without an end.
    std::vector<std::string> Finish();

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
