#include "report/CopyClock.h"

#include <string>

#include "report/LogFilter.h"

namespace assay_host {

namespace {

constexpr double kBatchBytes = 335544320; // ten copies of 16 MiB, with reads and writes counted
constexpr std::int64_t kDay = std::int64_t{24} * 60 * 60 * 1000;
constexpr std::string_view kBatch = "GPUImplHardware::checkBandwidthCL: ";
constexpr std::string_view kKey = ".CLBandwidth";

bool StartsWith(std::string_view text, std::string_view start)
{
    return text.substr(0, start.size()) == start;
}

bool EndsWith(std::string_view text, std::string_view end)
{
    return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

// `line` has the prefix of a log line: "# 00004.2026.11.21_10:49:36.366(".
std::int64_t GetMilliseconds(std::string_view line)
{
    const std::string_view time = line.substr(line.find('_') + 1);
    const auto read = [time](std::size_t at, std::size_t size) {
        std::int64_t number = 0;
        for (const char digit : time.substr(at, size))
            number = number * 10 + (digit - '0');
        return number;
    };
    return ((read(0, 2) * 60 + read(3, 2)) * 60 + read(6, 2)) * 1000 + read(9, 3);
}

} // namespace

void CopyClock::Add(const ReportLine& line)
{
    if (line.fKind == LineKind::kComment && IsLogLine(line.fText))
        AddLogText(GetLogText(line.fText), GetMilliseconds(line.fText));
    else if (line.fKind == LineKind::kValue && EndsWith(line.fKey, kKey))
        AddResult(line.fKey);
}

void CopyClock::AddResult(const std::string& key)
{
    if (fBatches > 0) {
        const std::int64_t passed = fEnd - *fStart + (fEnd < *fStart ? kDay : 0);
        const double seconds = static_cast<double>(passed + 1) / 1000;
        fBounds.push_back({key, fBatches * kBatchBytes / seconds});
    }
    fStart.reset();
    fBatches = 0;
}

void CopyClock::AddLogText(std::string_view text, std::int64_t time)
{
    if (!StartsWith(text, kBatch))
        return;
    text.remove_prefix(kBatch.size());
    if (StartsWith(text, "0 of ")) {
        fStart = time;
        fBatches = 0;
    } else if (fStart && StartsWith(text, "seconds=")) {
        fEnd = time;
        ++fBatches;
    }
}

} // namespace assay_host
