// Counts the values that facts had in the runs of a series.
#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <utility>
#include <vector>

namespace assay_host {

// Some runs, of which the first ones are named.
class RunList {
public:
    void Add(std::size_t run);
    void Add(const RunList& other);

    std::size_t GetCount() const { return fCount; }
    const std::vector<std::size_t>& GetNamed() const { return fNamed; }

    // Returns "run 4", "runs 4, 7" or "runs 4, 7 and 12 more".
    std::string GetText() const;

private:
    std::size_t fCount = 0;
    std::vector<std::size_t> fNamed; // at most kMaxNamedRuns
};

struct FactValue {
    std::string fText; // any bytes
    RunList fRuns;
};

// A fact that had more than one value.
struct ChangedFact {
    std::size_t fSubject;
    std::string fName;
    std::vector<FactValue> fValues; // the most frequent one first
    RunList fOthers;                // with further values, which were not kept
    RunList fDiffering;             // all but those of the first value
    std::size_t fRuns;              // all that have the fact
};

// One thread at a time.
class FactLog {
public:
    // Notes the value of a fact in a run. The subject is any number, such as that of a device. A
    // fact is left out if the log has become too large for it.
    void Add(std::size_t run, std::size_t subject, const std::string& name, std::string value);

    // Returns the facts that changed, by subject and name.
    std::vector<ChangedFact> GetChanged() const;

private:
    struct Fact {
        std::vector<FactValue> fValues; // as they came
        RunList fOthers;
    };

    bool Keep(std::size_t bytes);

    std::map<std::pair<std::size_t, std::string>, Fact> fFacts;
    std::size_t fBytes = 0;
};

} // namespace assay_host
