#include "fleet/PrometheusText.h"

#include <string>
#include <utility>
#include <vector>

#include <fmt/format.h>

#include "facts/TimeText.h"
#include "fleet/DeviceFacts.h"
#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/Usable.h"
#include "report/Warnings.h"

namespace assay_host {

namespace {

constexpr DeviceKind kKinds[] = {DeviceKind::kOpenGL, DeviceKind::kOpenCL};
constexpr Verdict kLastVerdict = Verdict::kInterrupted;
constexpr Usability kLastUsability = Usability::kUnknown;

using Labels = std::vector<std::pair<std::string, std::string>>;

// Returns the text as a label's value. No text here has a line end.
std::string EscapeLabel(const std::string& value)
{
    std::string text;
    for (const char byte : value) {
        if (byte == '\\' || byte == '"')
            text += '\\';
        text += byte;
    }
    return text;
}

class Exposition {
public:
    explicit Exposition(std::ostream& out) : fOut(out) {}

    // Starts a metric, or continues the current one. All are gauges: a run knows nothing of the
    // ones before it.
    void Start(const std::string& name, const char* help)
    {
        std::string full = "assay_" + name;
        if (full == fName)
            return;
        fName = std::move(full);
        fHelp = help;
    }

    void Add(const Labels& labels, double value)
    {
        if (fHelp != nullptr)
            fOut << fmt::format("# HELP {} {}\n# TYPE {} gauge\n", fName, fHelp, fName);
        fHelp = nullptr;
        std::string text;
        for (const auto& [name, labelValue] : labels)
            text +=
                fmt::format("{}{}=\"{}\"", text.empty() ? "" : ",", name, EscapeLabel(labelValue));
        fOut << fName << (text.empty() ? "" : "{" + text + "}") << ' ' << MakeNumberText(value)
             << '\n';
    }

private:
    std::ostream& fOut;
    std::string fName;
    const char* fHelp = nullptr; // null after the metric's first series
};

struct DeviceRow {
    Labels fLabels;
    std::vector<DeviceFact> fFacts;
};

std::vector<DeviceRow> MakeRows(const Answers& answers)
{
    std::vector<DeviceRow> rows;
    for (const DeviceAnswers& device : answers.fDevices)
        rows.push_back(
            {{{"api", GetApiName(device.fKind)}, {"device", device.fTag}}, GetDeviceFacts(device)});
    return rows;
}

void WriteRun(Exposition& text, const Answers& answers, const RunOutcome& outcome,
              const RunFacts& facts)
{
    text.Start("build_info", "Versions of the programs; always 1.");
    Labels versions;
    if (!facts.fHostVersion.empty())
        versions.emplace_back("version", facts.fHostVersion);
    if (facts.fChildVersion.IsKnown())
        versions.emplace_back("assay_version", ShowBytes(facts.fChildVersion.fValue));
    if (!versions.empty())
        text.Add(versions, 1);
    if (const auto time = ReadUtcText(facts.fEnvironment.fTime)) {
        text.Start("last_run_timestamp_seconds", "Start of the last run, since 1970 in UTC.");
        text.Add({}, static_cast<double>(*time));
    }
    // A run that never started, and a file without its end, have none.
    if (outcome.fSeconds > 0) {
        text.Start("last_run_duration_seconds", "Time from the child's launch to its end.");
        text.Add({}, outcome.fSeconds);
    }
    text.Start("run_verdict", "How the last run ended: 1 for its verdict, 0 for the others.");
    for (int verdict = 0; verdict <= static_cast<int>(kLastVerdict); ++verdict)
        text.Add({{"verdict", GetVerdictName(static_cast<Verdict>(verdict))}},
                 static_cast<Verdict>(verdict) == outcome.fVerdict ? 1 : 0);
    text.Start("usable", "Whether the interface can be used: 1 for the answer, 0 for the others.");
    for (const DeviceKind kind : kKinds) {
        const Usability found = JudgeUsable(kind, answers, outcome).fUsability;
        for (int answer = 0; answer <= static_cast<int>(kLastUsability); ++answer)
            text.Add({{"api", GetApiName(kind)},
                      {"answer", GetUsabilityName(static_cast<Usability>(answer))}},
                     static_cast<Usability>(answer) == found ? 1 : 0);
    }
    text.Start("warnings", "Number of warnings of the last run.");
    text.Add({}, static_cast<double>(GetWarnings(answers, outcome).size()));
    text.Start("devices", "Number of devices of the interface.");
    for (const DeviceKind kind : kKinds)
        if (const auto count = GetDeviceCount(kind, answers))
            text.Add({{"api", GetApiName(kind)}}, static_cast<double>(*count));
}

void WriteDevices(Exposition& text, const std::vector<DeviceRow>& rows)
{
    text.Start("device_info", "Texts that describe a device; always 1.");
    for (const DeviceRow& row : rows) {
        Labels labels = row.fLabels;
        for (const DeviceFact& fact : row.fFacts)
            if (const auto* const value = std::get_if<std::string>(&fact.fValue))
                labels.emplace_back(fact.fKey->fName, *value);
        text.Add(labels, 1);
    }
    for (const FactKey& key : GetFactKeys()) {
        for (const DeviceRow& row : rows)
            for (const DeviceFact& fact : row.fFacts) {
                if (fact.fKey != &key)
                    continue;
                if (const auto* const number = std::get_if<double>(&fact.fValue)) {
                    text.Start(key.fName, key.fHelp);
                    text.Add(row.fLabels, *number);
                } else if (const auto* const flag = std::get_if<bool>(&fact.fValue)) {
                    text.Start(fmt::format("device_{}", key.fName), key.fHelp);
                    text.Add(row.fLabels, *flag ? 1 : 0);
                }
            }
    }
}

} // namespace

void WritePrometheusText(std::ostream& out, const Report& report, const RunOutcome& outcome,
                         const RunFacts& facts)
{
    const Answers answers = GetAnswers(report);
    Exposition text(out);
    WriteRun(text, answers, outcome, facts);
    WriteDevices(text, MakeRows(answers));
}

} // namespace assay_host
