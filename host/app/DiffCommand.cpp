#include <algorithm>
#include <cstddef>
#include <cstdio>
#include <memory>
#include <optional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

#include "app/Commands.h"
#include "html/DiffPage.h"
#include "output/Output.h"
#include "output/SinkBuffer.h"
#include "report/Bytes.h"
#include "report/CompareRuns.h"
#include "report/ComparedRuns.h"
#include "report/DiffJson.h"
#include "report/DiffText.h"
#include "report/ReportFile.h"
#include "series/MedianReport.h"

namespace assay_host {

namespace {

// Writes each line after a prefix.
class PrefixedOutput {
public:
    explicit PrefixedOutput(Output& output) : fOutput(output) {}

    void SetPrefix(std::string prefix) { fPrefix = std::move(prefix); }

    void Write(std::string_view block)
    {
        std::string text;
        while (!block.empty()) {
            if (fIsAtStart)
                text += fPrefix;
            const std::size_t end = std::min(block.find('\n'), block.size() - 1) + 1;
            fIsAtStart = block[end - 1] == '\n';
            text += block.substr(0, end);
            block.remove_prefix(end);
        }
        fOutput.Write(text);
    }

private:
    Output& fOutput;
    std::string fPrefix;
    bool fIsAtStart = true;
};

// Loads a file. A series has its medians.
StoredRun LoadTypical(const std::string& path)
{
    StoredRun run = LoadRun(path);
    if (run.fSeries)
        run.fReport = GetTypicalReport(run);
    return run;
}

// Loads one of several files. Says on standard error why it can't be read, so that the others are
// compared all the same.
std::optional<StoredRun> TryLoad(const std::string& path)
{
    try {
        return LoadTypical(path);
    } catch (const std::runtime_error& failure) {
        std::fprintf(stderr, "assay-host: %s\n", ShowBytes(failure.what()).c_str());
        return std::nullopt;
    }
}

ComparisonOptions GetOptions(const DiffChoice& choice)
{
    ComparisonOptions options;
    options.fMeasurements.fTolerance = choice.fTolerance;
    options.fMeasurements.fSeriesTolerance = choice.fSeriesTolerance;
    options.fIdentity = choice.fIdentity;
    options.fAll = choice.fAll;
    options.fKeepSame = choice.fFormat == Format::kHtml;
    return options;
}

// What came of the comparisons.
struct Result {
    std::size_t fRead = 0;
    bool fAllRead = true;
    bool fDiffers = false;

    int GetStatus() const { return !fAllRead ? kDiffErrorStatus : fDiffers ? kDifferentStatus : 0; }
};

// Calls `take` with each file that can be read.
template <typename Take>
Result ForEachOther(const DiffChoice& choice, Take take)
{
    Result result;
    for (const std::string& path : choice.fAfter) {
        std::optional<StoredRun> run = TryLoad(path);
        if (!run) {
            result.fAllRead = false;
            continue;
        }
        ++result.fRead;
        result.fDiffers = !take(path, std::move(*run)) || result.fDiffers;
    }
    return result;
}

// Holds one of the other runs at a time.
Result WriteLines(const DiffChoice& choice, const StoredRun& before, Output& output)
{
    PrefixedOutput lines(output);
    SinkBuffer buffer([&lines](std::string_view block) { lines.Write(block); });
    std::ostream text(&buffer);
    text.exceptions(std::ios::badbit);
    const ComparisonOptions options = GetOptions(choice);
    const bool isOne = choice.fAfter.size() == 1;
    return ForEachOther(choice, [&](const std::string& path, const StoredRun& after) {
        lines.SetPrefix(isOne ? "" : ShowBytes(path) + ": ");
        const Comparison comparison = CompareRuns(before, after, options);
        PrintDiff(text, comparison);
        text.flush();
        return comparison.IsSame();
    });
}

Result WriteWhole(const DiffChoice& choice, StoredRun before, Output& output)
{
    ComparedRuns runs(choice.fBefore, std::move(before));
    const ComparisonOptions options = GetOptions(choice);
    const Result result = ForEachOther(choice, [&](const std::string& path, StoredRun after) {
        runs.Add(path, std::move(after), options);
        return runs.GetOthers().back().fComparison.IsSame();
    });
    if (result.fRead == 0)
        return result;
    SinkBuffer buffer([&output](std::string_view block) { output.Write(block); });
    std::ostream out(&buffer);
    out.exceptions(std::ios::badbit);
    if (choice.fFormat == Format::kHtml)
        WriteDiffPage(out, runs, ASSAY_VERSION);
    else
        WriteDiffDocument(out, runs, ASSAY_VERSION);
    out.flush();
    return result;
}

} // namespace

int Diff(const DiffChoice& choice)
{
    StoredRun before = LoadTypical(choice.fBefore);
    const std::unique_ptr<Output> output =
        choice.fOutput.empty() ? OpenStandardOutput() : OpenFile(choice.fOutput);
    output->Open();
    const Result result = choice.fFormat == Format::kText
                              ? WriteLines(choice, before, *output)
                              : WriteWhole(choice, std::move(before), *output);
    // Otherwise there is no file.
    if (result.fRead > 0)
        output->Finish();
    return result.GetStatus();
}

} // namespace assay_host
