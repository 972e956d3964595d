#include "report/LogFilter.h"

#include <algorithm>
#include <utility>

namespace assay_host {

namespace {

// The form of a prefix up to its delta. '0' is any digit; the first number may have more digits.
constexpr std::string_view kShape = "# 00000.0000.00.00_00:00:00.000(";

bool IsDigit(char character)
{
    return character >= '0' && character <= '9';
}

enum class Match { kNo, kSoFar, kWhole };

Match MatchPrefix(std::string_view line)
{
    std::size_t at = 0;
    for (std::size_t index = 0; index < kShape.size(); ++index) {
        if (kShape[index] == '.' && index == kShape.find('.'))
            while (at < line.size() && IsDigit(line[at]))
                ++at; // a number of more than five digits
        if (at == line.size())
            return Match::kSoFar;
        if (kShape[index] == '0' ? !IsDigit(line[at]) : kShape[index] != line[at])
            return Match::kNo;
        ++at;
    }
    return Match::kWhole;
}

} // namespace

bool IsLogLine(std::string_view line)
{
    return MatchPrefix(line) == Match::kWhole;
}

std::string_view GetLogText(std::string_view line)
{
    constexpr std::string_view kEnd = "] ";
    const std::size_t end = line.find(kEnd);
    return end == std::string_view::npos ? line : line.substr(end + kEnd.size());
}

std::vector<LogFilter::Piece> LogFilter::Feed(std::string_view bytes)
{
    std::vector<Piece> pieces;
    while (!bytes.empty()) {
        const std::size_t end = bytes.find('\n');
        const std::size_t size = end == std::string_view::npos ? bytes.size() : end + 1;
        FeedLine(bytes.substr(0, size), pieces);
        bytes.remove_prefix(size);
    }
    return pieces;
}

std::vector<LogFilter::Piece> LogFilter::Finish()
{
    std::vector<Piece> pieces;
    if (!fHeld.empty())
        pieces.push_back({fLine == Line::kLog, std::exchange(fHeld, {})});
    fLine = Line::kOpen;
    return pieces;
}

// `piece` has no line end except at its end.
void LogFilter::FeedLine(std::string_view piece, std::vector<Piece>& pieces)
{
    const bool isEnd = piece.back() == '\n';
    if (fLine != Line::kOther)
        fHeld += piece.substr(0, kMaxLineBytes - std::min(kMaxLineBytes, fHeld.size()));
    if (fLine == Line::kOpen) {
        const Match match = MatchPrefix(fHeld);
        if (match == Match::kWhole)
            fLine = Line::kLog;
        else if (match == Match::kNo || isEnd)
            fLine = Line::kOther;
        if (fLine == Line::kOther)
            piece = fHeld;
    }
    if (fLine == Line::kOther) {
        if (pieces.empty() || pieces.back().fIsLog)
            pieces.push_back({false, {}});
        pieces.back().fText += piece;
        fHeld.clear();
    } else if (isEnd) {
        fHeld.erase(fHeld.find_last_not_of("\r\n") + 1);
        pieces.push_back({true, std::exchange(fHeld, {})});
    }
    if (isEnd)
        fLine = Line::kOpen;
}

} // namespace assay_host
