#include "supervise/ErrorLines.h"

#include <algorithm>
#include <utility>

namespace assay_host {

std::vector<std::string> ErrorLines::Feed(std::string_view bytes)
{
    const auto room = static_cast<std::size_t>(kMaxBytes - std::min(kMaxBytes, fBytes));
    fBytes += bytes.size();
    std::string_view taken = bytes.substr(0, room);
    fLost += bytes.size() - taken.size();
    std::vector<std::string> lines;
    while (!taken.empty() && fLines < kMaxLines) {
        const std::size_t end = taken.find('\n');
        Hold(taken.substr(0, end));
        if (end == std::string_view::npos)
            return lines;
        taken.remove_prefix(end + 1);
        EndLine(lines);
    }
    fLost += taken.size();
    return lines;
}

std::vector<std::string> ErrorLines::Finish()
{
    std::vector<std::string> lines;
    if (!fLine.empty())
        EndLine(lines);
    return lines;
}

void ErrorLines::Hold(std::string_view piece)
{
    const std::string_view held = piece.substr(0, kMaxLineBytes - fLine.size());
    fLine += held;
    fLost += piece.size() - held.size();
}

void ErrorLines::EndLine(std::vector<std::string>& lines)
{
    if (!fLine.empty() && fLine.back() == '\r')
        fLine.pop_back();
    lines.push_back(std::exchange(fLine, {}));
    ++fLines;
}

} // namespace assay_host
