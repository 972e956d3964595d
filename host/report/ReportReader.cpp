#include "report/ReportReader.h"

#include <algorithm>
#include <utility>

#include "report/LineForm.h"

namespace assay_host {

std::vector<ReportLine> ReportReader::Feed(std::string_view bytes)
{
    fBytes += bytes.size();
    Lines lines;
    while (!bytes.empty() && fLineCount < fLimits.fMaxLines && GetRoom() > 0) {
        const std::string_view piece = bytes.substr(0, bytes.find('\n'));
        const std::size_t taken = GetTakenSize(piece.size());
        Append(piece.substr(0, taken));
        bytes.remove_prefix(taken);
        if (taken < piece.size() || bytes.empty())
            continue;
        const std::string lineEnd = fCarriageReturn ? "\r\n" : "\n";
        const std::uint64_t kept = fKept + lineEnd.size();
        fKept = std::min(kept, fLimits.fMaxBytes);
        if (kept > fLimits.fMaxBytes)
            break; // the report is full
        bytes.remove_prefix(1);
        EndLine(lineEnd, lines);
    }
    fLost += bytes.size();
    if (!bytes.empty() && (!fText.empty() || fCarriageReturn))
        fCut = true;
    return lines;
}

std::vector<ReportLine> ReportReader::Finish()
{
    Lines lines;
    if (fCarriageReturn)
        Hold("\r");
    fCarriageReturn = false;
    if (!fText.empty() || fCut)
        EndLine("", lines);
    ReleaseOpenQuote(lines);
    return lines;
}

// Returns the room in the current line.
std::size_t ReportReader::GetLineRoom() const
{
    const std::size_t room = fLimits.fMaxLineBytes - fText.size();
    return fCarriageReturn && room > 0 ? room - 1 : room;
}

// Returns the room in the report.
std::uint64_t ReportReader::GetRoom() const
{
    const bool keepsCarriageReturn = fCarriageReturn && fText.size() < fLimits.fMaxLineBytes;
    return fLimits.fMaxBytes - std::min(fLimits.fMaxBytes, fKept + (keepsCarriageReturn ? 1 : 0));
}

// How many of `size` further bytes of the current line are taken: all, unless the report is full
// before the line is.
std::size_t ReportReader::GetTakenSize(std::size_t size) const
{
    const std::uint64_t room = GetRoom();
    return size <= room || GetLineRoom() < room ? size : static_cast<std::size_t>(room);
}

void ReportReader::Append(std::string_view piece)
{
    if (piece.empty())
        return;
    if (fCarriageReturn)
        Hold("\r");
    fCarriageReturn = piece.back() == '\r';
    if (fCarriageReturn)
        piece.remove_suffix(1);
    Hold(piece);
}

void ReportReader::Hold(std::string_view piece)
{
    const std::size_t room = fLimits.fMaxLineBytes - fText.size();
    const std::string_view kept = piece.substr(0, room);
    fText += kept;
    fKept += kept.size();
    if (piece.size() > room) {
        fLost += piece.size() - room;
        fCut = true;
    }
}

void ReportReader::EndLine(const std::string& lineEnd, Lines& lines)
{
    std::string text = std::exchange(fText, {});
    const bool cut = std::exchange(fCut, false);
    fCarriageReturn = false;
    ++fLineCount;
    if (!fQuote.empty() &&
        (cut || BeginsLikeReportLine(text) || fQuoteBytes + text.size() > fLimits.fMaxLineBytes))
        ReleaseOpenQuote(lines);

    if (fQuote.empty() && (cut || !LeavesQuoteOpen(text))) {
        lines.push_back(ReadLine(std::move(text), lineEnd, cut));
        return;
    }
    const bool closes = !fQuote.empty() && !text.empty() && text.back() == '"';
    fQuoteBytes += text.size() + lineEnd.size();
    fQuote.push_back({std::move(text), lineEnd});
    if (!closes)
        return;
    std::string whole;
    whole.reserve(fQuoteBytes);
    for (std::size_t line = 0; line + 1 < fQuote.size(); ++line)
        whole += fQuote[line].fText + fQuote[line].fLineEnd;
    whole += fQuote.back().fText;
    fQuote.clear();
    fQuoteBytes = 0;
    lines.push_back(ReadLine(std::move(whole), lineEnd, false));
}

void ReportReader::ReleaseOpenQuote(Lines& lines)
{
    for (OpenLine& line : fQuote)
        lines.push_back(ReadLine(std::move(line.fText), std::move(line.fLineEnd), false));
    fQuote.clear();
    fQuoteBytes = 0;
}

} // namespace assay_host
