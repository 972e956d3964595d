// A stored run, and others that are compared with it.
#pragma once

#include <deque>
#include <string>
#include <utility>

#include "report/CompareRuns.h"
#include "report/StoredRun.h"

namespace assay_host {

struct ComparedRun {
    std::string fFile; // the path, as given
    StoredRun fRun;
    Comparison fComparison; // with the first run
};

// The comparisons point into the runs, which therefore can't be moved.
class ComparedRuns {
public:
    ComparedRuns(std::string file, StoredRun run) : fFile(std::move(file)), fRun(std::move(run)) {}
    ComparedRuns(const ComparedRuns&) = delete;
    ComparedRuns& operator=(const ComparedRuns&) = delete;

    // Compares the run with the first one.
    void Add(std::string file, StoredRun run, const ComparisonOptions& options)
    {
        ComparedRun& other = fOthers.emplace_back();
        other.fFile = std::move(file);
        other.fRun = std::move(run);
        other.fComparison = CompareRuns(fRun, other.fRun, options);
    }

    const std::string& GetFile() const { return fFile; }
    const StoredRun& GetRun() const { return fRun; }
    const std::deque<ComparedRun>& GetOthers() const { return fOthers; }

private:
    const std::string fFile;
    const StoredRun fRun;
    std::deque<ComparedRun> fOthers;
};

} // namespace assay_host
