#include "report/ReportReader.h"

#include <algorithm>
#include <utility>

#include "report/LineForm.h"

namespace assay_host {

std::vector<ReportLine> ReportReader::Feed(std::string_view bytes)
{
    const std::uint64_t room = fLimits.fMaxBytes - std::min(fLimits.fMaxBytes, fBytes);
    fBytes += bytes.size();
    std::string_view taken = bytes.substr(0, std::min<std::uint64_t>(room, bytes.size()));
    const std::size_t refused = bytes.size() - taken.size();
    Lines lines;
    while (!taken.empty() && fLineCount < fLimits.fMaxLines) {
        const std::size_t end = taken.find('\n');
        Append(taken.substr(0, end));
        if (end == std::string_view::npos) {
            taken = {};
        } else {
            EndLine(fCarriageReturn ? "\r\n" : "\n", lines);
            taken.remove_prefix(end + 1);
        }
    }
    fLost += taken.size() + refused;
    if (refused > 0 && (!fText.empty() || fCarriageReturn))
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
    fText += piece.substr(0, room);
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
