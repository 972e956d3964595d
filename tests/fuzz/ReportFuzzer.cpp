// Feeds any bytes in pieces of any size to the report's reader, and checks that it loses only bytes
// beyond its limits.
#include <algorithm>
#include <cstdint>
#include <string_view>
#include <vector>

#include "Require.h"
#include "report/LineForm.h"
#include "report/Report.h"
#include "report/ReportReader.h"

namespace {

using assay_host::Report;
using assay_host::ReportLine;
using assay_host::ReportReader;

bool IsSame(const ReportLine& a, const ReportLine& b)
{
    return a.fKind == b.fKind && a.fText == b.fText && a.fLineEnd == b.fLineEnd &&
           a.fCut == b.fCut && a.fKey == b.fKey && a.fValue == b.fValue && a.fQuoted == b.fQuoted;
}

struct Outcome {
    Report fReport;
    std::uint64_t fLost;
};

// `pieces` are the sizes of the pieces, used in turn; if empty, all data is one piece.
Outcome Read(std::string_view data, const ReportReader::Limits& limits, std::string_view pieces)
{
    ReportReader reader(limits);
    Outcome outcome{};
    std::size_t next = 0;
    for (std::string_view rest = data; !rest.empty();) {
        std::size_t size = rest.size();
        if (!pieces.empty()) {
            size = std::min<std::size_t>(
                size, 1U + static_cast<unsigned char>(pieces[next++ % pieces.size()]));
        }
        outcome.fReport.Add(reader.Feed(rest.substr(0, size)));
        rest.remove_prefix(size);
    }
    outcome.fReport.Add(reader.Finish());
    outcome.fLost = reader.GetLostByteCount();
    Require(reader.GetByteCount() == data.size());
    Require(reader.Finish().empty());
    return outcome;
}

void CheckLine(const ReportLine& line, const ReportReader::Limits& limits)
{
    // A quoted value of several lines may exceed the limit by its line ends.
    Require(line.fText.size() <= 3 * limits.fMaxLineBytes + 2);
    const ReportLine again = assay_host::ReadLine(line.fText, line.fLineEnd, line.fCut);
    Require(IsSame(again, line));
}

void Check(std::string_view data, const ReportReader::Limits& limits, std::string_view pieces)
{
    const Outcome whole = Read(data, limits, {});
    const Outcome split = Read(data, limits, pieces);
    const std::vector<ReportLine>& lines = whole.fReport.GetLines();
    Require(whole.fLost == split.fLost);
    Require(lines.size() == split.fReport.GetLines().size());
    Require(std::equal(lines.begin(), lines.end(), split.fReport.GetLines().begin(), IsSame));
    const std::string text = whole.fReport.ToText();
    Require(text.size() + whole.fLost == data.size());
    Require(whole.fLost > 0 || text == data);
    for (const ReportLine& line : lines)
        CheckLine(line, limits);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

// The first bytes choose the limits and the pieces.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    constexpr std::size_t kChoices = 6;
    if (size < kChoices)
        return 0;
    const std::vector<char> bytes(data, data + size);
    const std::string_view all(bytes.data(), bytes.size());
    const std::string_view rest = all.substr(kChoices);
    ReportReader::Limits limits;
    limits.fMaxLineBytes = data[0];
    limits.fMaxLines = data[1];
    limits.fMaxBytes = std::uint64_t{data[2]} * 4;
    const std::string_view pieces = all.substr(3, kChoices - 3);
    Check(rest, limits, pieces);
    Check(rest, {}, pieces);
    Check(rest, {}, std::string_view("\0", 1));
    return 0;
}
