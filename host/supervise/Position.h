// Where in its sequence a child is, from the report so far.
#pragma once

#include <cstddef>
#include <set>
#include <string>
#include <unordered_map>
#include <vector>

#include "report/KnownKeys.h"
#include "report/ReportLine.h"

namespace assay_host {

class Position {
public:
    Position();

    void Add(const ReportLine& line);

    // Steps that are known to be taken.
    std::size_t GetSteps() const { return fSteps; }

    // The key whose line comes next, and so what the child is at; empty behind the last one. A
    // device without CUDA has no line for its version, and asks nothing risky there.
    std::string GetNextKey() const;

private:
    struct Entry {
        std::string fTag; // empty if the key belongs to no device
        std::string fKey;
        bool fTakesStep;
        bool fMayBeSilent;
    };

    void Build();
    void AddDevices(DeviceKind kind, std::size_t count);

    std::size_t fGLCount = 0;
    std::size_t fCLCount = 0;
    std::vector<Entry> fEntries;
    std::unordered_map<std::string, std::size_t> fPlaces;
    std::set<std::string> fDropped; // tags of devices that were passed over
    std::set<std::string> fSilent;  // tags of devices that print no CUDAVersion
    std::size_t fNext = 0;
    std::size_t fSteps = 0;
};

} // namespace assay_host
