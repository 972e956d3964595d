// Collects the runs of a series. Keeps one report and one outcome, those of the run that is shown:
// the first one of the worst verdict. Of the other runs it keeps the measurements and what changed.
#pragma once

#include <array>
#include <cstddef>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "report/Answers.h"
#include "report/StoredRun.h"
#include "series/DeviceList.h"
#include "series/FactLog.h"
#include "series/Series.h"

namespace assay_host {

// One thread at a time.
class SeriesCollector {
public:
    explicit SeriesCollector(const SeriesPlan& plan, std::size_t maxSamples = kMaxSeriesSamples);

    // Adds the next run. One that was interrupted is only shown if it is the first.
    void Add(Report report, RunOutcome outcome);

    std::size_t GetRunCount() const { return fSeries.fRuns; }

    // Whether the series has to end, since it has as many samples as a document can have.
    bool IsFull() const { return fSampleCount >= fMaxSamples; }

    // Returns the run that is shown, with its series and without facts. Of a series that was
    // interrupted, the outcome's verdict is that of an interrupted run. `seconds`: since the first
    // launch. Call once, after at least one run.
    StoredRun Finish(SeriesEnd end, double seconds);

private:
    using Places = std::vector<std::size_t>; // in fDevices, of each device of a run

    void AddVerdict(const RunOutcome& outcome);
    void AddUsable(DeviceKind kind, Usability& worst, const Answers& answers,
                   const RunOutcome& outcome);
    void AddFacts(const Answers& answers, const Places& places);
    void AddFact(std::size_t subject, const Answer& answer);
    void AddPresence(const Answers& answers, const Places& places);
    void AddMeasurements(const Answers& answers, const Places& places);
    void AddTime(const RunOutcome& outcome);
    void Show(Report report, RunOutcome outcome, const Places& places, const Answers& answers);

    void AddVerdictFindings();
    void AddUsableFindings();
    void AddDeviceFindings();
    void AddFactFindings();
    void AddUnknownFindings(const Measurement& measurement);

    struct Presence {
        std::size_t fPresent = 0;
        RunList fAbsent; // the runs that could have had the device
    };

    const std::size_t fMaxSamples;
    std::size_t fSampleCount = 0;
    std::map<Verdict, RunList> fVerdicts;
    std::map<std::pair<Verdict, std::string>, RunList> fReasons;
    FactLog fUsable;
    FactLog fTags;
    FactLog fFacts;
    DeviceList fDevices;
    std::vector<Presence> fPresence; // by place
    std::array<RunList, 2> fCounted; // the runs that say how many devices of a kind there are
    std::vector<std::map<const KnownKey*, Measurement>> fMeasurements; // by place
    Measurement fTime;
    // The devices of the run that is shown, by place.
    std::map<std::size_t, KnownDevice> fShownDevices;
    StoredRun fShown;
    Series fSeries;
};

} // namespace assay_host
