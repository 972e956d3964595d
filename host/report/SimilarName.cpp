#include "report/SimilarName.h"

#include <algorithm>
#include <cstddef>

namespace assay_host {

namespace {

// The number of insertions, deletions and exchanges of bytes between two texts. Letters of either
// case are equal, as keys are easily mistyped by their case.
std::size_t GetDistance(std::string_view left, std::string_view right)
{
    const auto lower = [](char byte) {
        return byte >= 'A' && byte <= 'Z' ? static_cast<char>(byte - 'A' + 'a') : byte;
    };
    std::vector<std::size_t> row(right.size() + 1);
    for (std::size_t column = 0; column < row.size(); ++column)
        row[column] = column;
    for (std::size_t line = 0; line < left.size(); ++line) {
        std::size_t diagonal = row[0];
        row[0] = line + 1;
        for (std::size_t column = 0; column < right.size(); ++column) {
            const std::size_t changed =
                diagonal + (lower(left[line]) == lower(right[column]) ? 0 : 1);
            diagonal = row[column + 1];
            row[column + 1] = std::min({row[column + 1] + 1, row[column] + 1, changed});
        }
    }
    return row.back();
}

} // namespace

std::string FindSimilarName(std::string_view written, const std::vector<std::string>& names)
{
    std::string best;
    std::size_t bestDistance = std::max<std::size_t>(2, written.size() / 3) + 1;
    for (const std::string& name : names) {
        const std::size_t distance = GetDistance(written, name);
        if (distance < bestDistance) {
            bestDistance = distance;
            best = name;
        }
    }
    return best;
}

} // namespace assay_host
