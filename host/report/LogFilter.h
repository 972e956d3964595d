// Removes the lines of the child's log from its output, for a host that requests the log and wants
// the report without it.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

// Splits output into pieces, in order. One thread at a time.
class LogFilter {
public:
    struct Piece {
        bool fIsLog = false;
        std::string fText; // a log line without its line end, or any bytes of the rest
    };

    // The rest of a longer log line is dropped.
    static constexpr std::size_t kMaxLineBytes = std::size_t{1} << 16;

    // Returns the pieces that these bytes complete. Bytes that may begin a log line are kept.
    std::vector<Piece> Feed(std::string_view bytes);

    // Call at the end of the output. Returns the kept bytes.
    std::vector<Piece> Finish();

private:
    enum class Line {
        kOpen, // may still become a log line
        kLog,
        kOther
    };

    void FeedLine(std::string_view piece, std::vector<Piece>& pieces);

    Line fLine = Line::kOpen;
    std::string fHeld;
};

// Whether the line has the prefix of a log line: "# 00004.2026.11.21_10:49:36.366(+00.000)[tid=1]
// ".
bool IsLogLine(std::string_view line);

// Returns the text after the prefix of a log line.
std::string_view GetLogText(std::string_view line);

} // namespace assay_host
