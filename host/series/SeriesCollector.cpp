#include "series/SeriesCollector.h"

#include <algorithm>
#include <set>

#include <fmt/format.h>

#include "report/Numbers.h"
#include "report/ValueText.h"
#include "series/Findings.h"

namespace assay_host {

namespace {

// Different reasons of verdicts. Runs with further ones are listed without a reason.
constexpr std::size_t kMaxReasons = 100;

// The subjects of facts: the run, and each device by its place.
constexpr std::size_t kRunSubject = 0;

std::size_t GetSubject(std::size_t place)
{
    return place + 1;
}

bool IsMeasurement(const Answer& answer)
{
    return answer.fKnown != nullptr && answer.fKnown->fMatch == Match::kNumber;
}

// Whether the run says how many devices of the kind there are.
bool CountsDevices(const Answers& answers, DeviceKind kind)
{
    return std::any_of(answers.fReport.begin(), answers.fReport.end(), [kind](const Answer& each) {
        return each.fKey == GetCountKey(kind) &&
               (each.IsKnown() || each.fMissing == Missing::kNoOpenCL);
    });
}

SeriesSample MakeSample(std::size_t run, const Answer& answer)
{
    if (answer.fLine == nullptr)
        return {run, 0, GetMissingText(answer.fMissing), {}};
    if (!answer.IsKnown())
        return {run, 0, GetUnknownText(answer.fUnknown), answer.fLine->fValue};
    const auto number = ReadDouble(answer.fLine->fValue);
    if (!number)
        return {run, 0, "it is no number", answer.fLine->fValue};
    return {run, *number, {}, {}};
}

} // namespace

SeriesCollector::SeriesCollector(const SeriesPlan& plan, std::size_t maxSamples)
    : fMaxSamples(maxSamples)
{
    fSeries.fPlan = plan;
}

void SeriesCollector::Add(Report report, RunOutcome outcome)
{
    ++fSeries.fRuns;
    const Answers answers = GetAnswers(report);
    const Places places = fDevices.Match(answers.fDevices);
    fMeasurements.resize(fDevices.GetDevices().size());
    AddVerdict(outcome);
    // What an interrupted run didn't reach says nothing about the machine.
    if (outcome.fVerdict != Verdict::kInterrupted || fSeries.fRuns == 1) {
        AddUsable(DeviceKind::kOpenGL, fSeries.fOpenGL, answers, outcome);
        AddUsable(DeviceKind::kOpenCL, fSeries.fOpenCL, answers, outcome);
    }
    AddFacts(answers, places);
    AddPresence(answers, places);
    AddMeasurements(answers, places);
    AddTime(outcome);
    const bool isWorse =
        outcome.fVerdict != Verdict::kInterrupted &&
        GetVerdictStatus(outcome.fVerdict) > GetVerdictStatus(fShown.fOutcome.fVerdict);
    if (fSeries.fRuns == 1 || isWorse)
        Show(std::move(report), std::move(outcome), places, answers);
}

void SeriesCollector::AddVerdict(const RunOutcome& outcome)
{
    fVerdicts[outcome.fVerdict].Add(fSeries.fRuns);
    const auto key = std::make_pair(outcome.fVerdict, outcome.fReason);
    const bool isKept = fReasons.size() < kMaxReasons || fReasons.count(key) > 0;
    fReasons[isKept ? key : std::make_pair(outcome.fVerdict, std::string())].Add(fSeries.fRuns);
}

void SeriesCollector::AddUsable(DeviceKind kind, Usability& worst, const Answers& answers,
                                const RunOutcome& outcome)
{
    const Usability usable = JudgeUsable(kind, answers, outcome).fUsability;
    worst = fSeries.fRuns == 1 ? usable : GetLesser(worst, usable);
    fUsable.Add(fSeries.fRuns, static_cast<std::size_t>(kind), "usable", GetUsabilityName(usable));
}

void SeriesCollector::AddFacts(const Answers& answers, const Places& places)
{
    for (const Answer& answer : answers.fReport)
        AddFact(kRunSubject, answer);
    for (std::size_t index = 0; index < places.size(); ++index) {
        const DeviceAnswers& device = answers.fDevices[index];
        fTags.Add(fSeries.fRuns, places[index], "tag", device.fTag);
        for (const Answer& answer : device.fAnswers)
            AddFact(GetSubject(places[index]), answer);
    }
}

void SeriesCollector::AddFact(std::size_t subject, const Answer& answer)
{
    if (IsMeasurement(answer) ||
        (answer.fKnown != nullptr && answer.fKnown->fMatch == Match::kStamp))
        return;
    if (answer.fLine == nullptr) {
        // The other reasons are those of the run, not of the machine.
        if (answer.fMissing == Missing::kNotPrinted || answer.fMissing == Missing::kNoOpenCL)
            fFacts.Add(fSeries.fRuns, subject, answer.fKey, GetMissingText(answer.fMissing));
        return;
    }
    if (answer.fUnknown == Unknown::kCut)
        return;
    const std::string& value = answer.fLine->fValue;
    fFacts.Add(fSeries.fRuns, subject, answer.fKey,
               answer.fLine->fQuoted ? '"' + value + '"' : value);
}

void SeriesCollector::AddPresence(const Answers& answers, const Places& places)
{
    const std::size_t before = fPresence.size();
    fPresence.resize(fDevices.GetDevices().size());
    const std::set<std::size_t> present(places.begin(), places.end());
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
        if (!CountsDevices(answers, kind))
            continue;
        RunList& counted = fCounted[static_cast<std::size_t>(kind)];
        for (std::size_t place = 0; place < fPresence.size(); ++place) {
            if (fDevices.GetDevices()[place].fKind != kind)
                continue;
            Presence& presence = fPresence[place];
            if (place >= before) // the earlier runs didn't have it
                presence.fAbsent = counted;
            if (present.count(place) > 0)
                ++presence.fPresent;
            else
                presence.fAbsent.Add(fSeries.fRuns);
        }
        counted.Add(fSeries.fRuns);
    }
}

void SeriesCollector::AddMeasurements(const Answers& answers, const Places& places)
{
    for (std::size_t index = 0; index < places.size(); ++index) {
        for (const Answer& answer : answers.fDevices[index].fAnswers) {
            if (!IsMeasurement(answer))
                continue;
            const KnownDevice& device = fDevices.GetDevices()[places[index]];
            Measurement& measurement = fMeasurements[places[index]][answer.fKnown];
            measurement.fKey = answer.fKnown;
            measurement.fTag = device.fTag;
            measurement.fName = device.fName;
            measurement.fSamples.push_back(MakeSample(fSeries.fRuns, answer));
            ++fSampleCount;
        }
    }
}

void SeriesCollector::AddTime(const RunOutcome& outcome)
{
    SeriesSample sample{fSeries.fRuns, outcome.fSeconds};
    if (outcome.fVerdict != Verdict::kComplete)
        sample = {fSeries.fRuns, 0, "the run was not complete"};
    fTime.fSamples.push_back(std::move(sample));
    ++fSampleCount;
}

void SeriesCollector::Show(Report report, RunOutcome outcome, const Places& places,
                           const Answers& answers)
{
    fSeries.fShown = fSeries.fRuns;
    fShownDevices.clear();
    for (std::size_t index = 0; index < places.size(); ++index)
        fShownDevices[places[index]] = {answers.fDevices[index].fKind, answers.fDevices[index].fTag,
                                        GetDeviceName(answers.fDevices[index])};
    fShown.fReport = std::move(report);
    fShown.fOutcome = std::move(outcome);
}

StoredRun SeriesCollector::Finish(SeriesEnd end, double seconds)
{
    fSeries.fEnd = end;
    fSeries.fSeconds = seconds;
    for (const auto& [verdict, runs] : fVerdicts)
        fSeries.fVerdicts.push_back({verdict, runs.GetCount()});
    AddVerdictFindings();
    AddUsableFindings();
    AddDeviceFindings();
    AddFactFindings();
    for (std::size_t place = 0; place < fMeasurements.size(); ++place) {
        for (auto& [key, measurement] : fMeasurements[place]) {
            const auto shown = fShownDevices.find(place);
            if (shown != fShownDevices.end()) {
                measurement.fTag = shown->second.fTag;
                measurement.fName = shown->second.fName;
            }
            AddUnknownFindings(measurement);
            fSeries.fMeasurements.push_back(std::move(measurement));
        }
    }
    fSeries.fMeasurements.push_back(std::move(fTime));
    if (end == SeriesEnd::kInterrupted && fShown.fOutcome.fVerdict != Verdict::kInterrupted) {
        fShown.fOutcome.fVerdict = Verdict::kInterrupted;
        fShown.fOutcome.fReason =
            fmt::format("The series was interrupted in or after its run {}.", fSeries.fRuns);
    }
    fShown.fSeries = std::move(fSeries);
    return std::move(fShown);
}

void SeriesCollector::AddVerdictFindings()
{
    if (fReasons.size() == 1)
        return;
    for (const auto& [key, runs] : fReasons)
        if (key.first != Verdict::kComplete)
            fSeries.fFindings.push_back(
                MakeVerdictFinding(key.first, key.second, runs, fSeries.fRuns));
}

void SeriesCollector::AddUsableFindings()
{
    for (const ChangedFact& fact : fUsable.GetChanged())
        fSeries.fFindings.push_back(
            MakeUsableFinding(fact, static_cast<DeviceKind>(fact.fSubject)));
}

void SeriesCollector::AddDeviceFindings()
{
    const std::vector<KnownDevice>& devices = fDevices.GetDevices();
    for (std::size_t place = 0; place < fPresence.size(); ++place) {
        const Presence& presence = fPresence[place];
        const std::size_t absent = presence.fAbsent.GetCount();
        if (absent > 0)
            fSeries.fFindings.push_back(
                MakeAbsenceFinding(devices[place], presence.fAbsent, presence.fPresent + absent));
    }
    for (const ChangedFact& fact : fTags.GetChanged())
        fSeries.fFindings.push_back(MakeTagFinding(fact, devices[fact.fSubject]));
}

void SeriesCollector::AddFactFindings()
{
    for (const ChangedFact& fact : fFacts.GetChanged()) {
        const KnownDevice* const device =
            fact.fSubject == kRunSubject ? nullptr : &fDevices.GetDevices()[fact.fSubject - 1];
        fSeries.fFindings.push_back(MakeFactFinding(fact, device));
    }
}

void SeriesCollector::AddUnknownFindings(const Measurement& measurement)
{
    std::map<std::string, RunList> reasons;
    for (const SeriesSample& sample : measurement.fSamples)
        if (!sample.fText.empty())
            reasons[sample.fReason].Add(sample.fRun);
    for (const auto& [reason, runs] : reasons)
        // Of all runs alike it is a warning.
        if (runs.GetCount() < measurement.fSamples.size())
            fSeries.fFindings.push_back(
                MakeUnknownFinding(measurement, reason, runs, measurement.fSamples.size()));
}

} // namespace assay_host
