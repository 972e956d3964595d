#include "report/TextTable.h"

#include <algorithm>
#include <utility>

#include <fmt/format.h>

#include "report/Bytes.h"

namespace assay_host {

namespace {

constexpr std::size_t kIndent = 2;
constexpr std::size_t kGap = 2;
constexpr std::size_t kMinValueWidth = 20;

// Returns the number of bytes of the first `width` characters.
std::size_t CountBytes(std::string_view text, std::size_t width)
{
    std::size_t bytes = 0;
    for (std::size_t column = 0; column < width && bytes < text.size(); ++column)
        bytes += std::max<std::size_t>(ReadCharacter(text.substr(bytes)).fSize, 1);
    return bytes;
}

} // namespace

void TextTable::Add(std::string label, std::string value)
{
    fRows.push_back({std::move(label), std::move(value)});
}

void TextTable::Print(std::ostream& out, std::size_t width) const
{
    std::size_t labels = 0;
    for (const Row& row : fRows)
        if (!row.fValue.empty())
            labels = std::max(labels, CountColumns(row.fLabel));
    const std::size_t values = kIndent + labels + kGap;
    const std::size_t room = std::max(kMinValueWidth, width > values ? width - values : 0);
    for (const Row& row : fRows) {
        std::string label = std::string(kIndent, ' ') + row.fLabel;
        if (row.fValue.empty()) {
            out << label << "\n";
            continue;
        }
        label.append(labels + kGap - CountColumns(row.fLabel), ' ');
        for (const std::string& line : WrapText(row.fValue, room)) {
            out << label << line << "\n";
            label.assign(values, ' ');
        }
    }
}

std::vector<std::string> WrapText(std::string_view text, std::size_t width)
{
    std::vector<std::string> lines;
    while (true) {
        const std::size_t max = CountBytes(text, width);
        if (max == text.size())
            break;
        std::size_t end = text.rfind(' ', max);
        if (end == std::string_view::npos || end == 0)
            end = max;
        lines.emplace_back(text.substr(0, end));
        text.remove_prefix(end);
        if (!text.empty() && text.front() == ' ')
            text.remove_prefix(1);
    }
    lines.emplace_back(text);
    return lines;
}

} // namespace assay_host
