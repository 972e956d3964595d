// Takes the lines of the child's log out of its output, for a host that asks for the log and wants
// the report as it is without one.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

// Splits output into pieces, in order. Serves one thread at a time.
class LogFilter {
public:
    struct Piece {
        bool fIsLog = false;
        std::string fText; // a log line without its line end, or any bytes of the rest
    };

    // A log line is cut here; the rest of it is dropped.
    static constexpr std::size_t kMaxLineBytes = std::size_t{1} << 16;

    // The pieces that these bytes complete. Bytes that may begin a log line are held back.
    std::vector<Piece> Feed(std::string_view bytes);

    // What is held back at the end of the output.
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

// The text after the prefix of a log line.
std::string_view GetLogText(std::string_view line);

} // namespace assay_host
