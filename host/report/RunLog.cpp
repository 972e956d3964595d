#include "report/RunLog.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <utility>

#include "report/Causes.h"
#include "report/LineForm.h"
#include "report/LoadedFiles.h"

namespace assay_host {

namespace {

constexpr std::size_t kMaxCauses = 100;
constexpr std::string_view kTerminated = "Testing terminated for ";
constexpr std::string_view kFailureStarts[] = {"exception: ", "QGF::LogicalException: "};

bool StartsWith(std::string_view text, std::string_view start)
{
    return text.substr(0, start.size()) == start;
}

void AddCause(RunOutcome& outcome, std::string key, std::string text)
{
    if (outcome.fCauses.size() < kMaxCauses)
        outcome.fCauses.push_back({std::move(key), std::move(text)});
}

// Returns a failure line without the part that all have.
std::string_view GetFailureText(std::string_view line)
{
    for (const std::string_view start : kFailureStarts)
        if (StartsWith(line, start))
            return line.substr(start.size());
    return line;
}

} // namespace

bool RunLog::Add(std::string_view text, const SequenceReader& sequence, RunOutcome& outcome)
{
    if (TakeLoadedFile(text, outcome.fDrivers))
        return true;
    std::string cause = FindCauseText(text);
    if (!cause.empty()) {
        AddCause(outcome, sequence.GetNextAnswerKey(), std::move(cause));
    } else if (StartsWith(text, kTerminated)) {
        const std::string key = sequence.GetNextAnswerKey();
        const bool isOfDevice = GetDeviceTag(key) == text.substr(kTerminated.size());
        fFailedKeys.push_back(isOfDevice ? key : std::string());
    }
    return false;
}

void RunLog::Finish(RunOutcome& outcome) const
{
    std::vector<std::string_view> lines;
    for (const std::string& line : outcome.fErrorLines)
        if (IsFailureLine(line))
            lines.push_back(line);
    if (lines.size() != fFailedKeys.size())
        return;
    for (std::size_t index = 0; index < lines.size(); ++index) {
        const std::string& key = fFailedKeys[index];
        if (!key.empty() && outcome.FindCause(key).empty())
            AddCause(outcome, key, std::string(GetFailureText(lines[index])));
    }
}

bool IsFailureLine(const std::string& line)
{
    return line == "unknown exception" ||
           std::any_of(std::begin(kFailureStarts), std::end(kFailureStarts),
                       [&line](std::string_view start) { return StartsWith(line, start); });
}

} // namespace assay_host
