#include <algorithm>
#include <cstdio>
#include <memory>
#include <optional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>

#include "app/Commands.h"
#include "output/Output.h"
#include "output/SinkBuffer.h"
#include "report/Bytes.h"
#include "report/CompareRuns.h"
#include "report/DiffText.h"
#include "report/ReportFile.h"

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

// Loads one of several files. Says on standard error why it can't be read, so that the others are
// compared all the same.
std::optional<StoredRun> TryLoad(const std::string& path)
{
    try {
        return LoadRun(path);
    } catch (const std::runtime_error& failure) {
        std::fprintf(stderr, "assay-host: %s\n", ShowBytes(failure.what()).c_str());
        return std::nullopt;
    }
}

} // namespace

int Diff(const DiffChoice& choice)
{
    const StoredRun before = LoadRun(choice.fBefore);
    ComparisonOptions options;
    options.fMeasurements.fTolerance = choice.fTolerance;
    options.fIdentity = choice.fIdentity;
    options.fAll = choice.fAll;
    const std::unique_ptr<Output> output = OpenStandardOutput();
    PrefixedOutput lines(*output);
    SinkBuffer buffer([&lines](std::string_view block) { lines.Write(block); });
    std::ostream text(&buffer);
    text.exceptions(std::ios::badbit);
    const bool isOne = choice.fAfter.size() == 1;
    bool differs = false;
    bool isRead = true;
    for (const std::string& path : choice.fAfter) {
        const std::optional<StoredRun> after = TryLoad(path);
        if (!after) {
            isRead = false;
            continue;
        }
        lines.SetPrefix(isOne ? "" : ShowBytes(path) + ": ");
        const Comparison comparison = CompareRuns(before, *after, options);
        PrintDiff(text, comparison);
        differs = differs || !comparison.IsSame();
        text.flush();
    }
    if (!isRead)
        return kDiffErrorStatus;
    return differs ? kDifferentStatus : 0;
}

} // namespace assay_host
