#include "html/ReportPage.h"

#include <algorithm>
#include <string>
#include <vector>

#include <fmt/format.h>

#include "html/BarChart.h"
#include "html/DeviceCard.h"
#include "html/Markup.h"
#include "html/Page.h"
#include "html/SeriesSection.h"
#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/Explanations.h"
#include "report/JsonDocument.h"
#include "report/NextSteps.h"
#include "report/Numbers.h"
#include "report/RunText.h"
#include "report/Usable.h"
#include "report/ValueText.h"
#include "report/Warnings.h"
#include "series/MedianReport.h"

namespace assay_host {

namespace {

class ReportPage {
public:
    ReportPage(Markup& page, const Report& report, const RunOutcome& outcome, const RunFacts& facts,
               const Series* series)
        : fPage(page),
          fReport(report),
          fOutcome(outcome),
          fFacts(facts),
          fSeries(series),
          fTypical(series != nullptr ? MakeMedianReport(report, *series) : Report()),
          fAnswers(series != nullptr ? GetAnswers(fTypical, outcome) : GetAnswers(report, outcome))
    {}

    void Add()
    {
        AddHeader();
        AddMain();
    }

    // What the run shows. A whole report says nothing about what a host can do with the machine.
    std::string GetHeadline() const
    {
        return fOutcome.fVerdict == Verdict::kComplete
                   ? JudgeUsable(DeviceKind::kOpenGL, fAnswers, fOutcome).fText
                   : ShowBytes(fOutcome.fReason);
    }

private:
    void AddHeader()
    {
        const Element header(fPage, "header");
        fPage.Add("h1", GetHeadline());
        {
            const Element list(fPage, "dl");
            for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
                const Usable usable = JudgeUsable(kind, fAnswers, fOutcome);
                fPage.Add("dt", GetKindName(kind));
                const Element cell(fPage, "dd");
                fPage.Add("span", GetUsabilityName(usable.fUsability),
                          {{"class", GetUsabilityName(usable.fUsability)}});
                fPage.AddText(fmt::format(
                    "{}: {}", usable.fTag.empty() ? "" : " (" + usable.fTag + ")", usable.fText));
            }
        }
        AddList(fPage, "h2", "What to do", GetNextSteps(fAnswers, fOutcome));
        std::vector<std::string> warnings;
        for (const Warning& warning : GetWarnings(fAnswers, fOutcome))
            warnings.push_back(GetWarningText(warning));
        AddList(fPage, "h2", "Warnings", warnings);
    }

    void AddMain()
    {
        const Element main(fPage, "main");
        if (!fAnswers.fDevices.empty()) {
            const Element devices(fPage, "div", {{"class", "devices"}});
            for (const DeviceAnswers& device : fAnswers.fDevices)
                AddDeviceCard(fPage, device);
        }
        if (fSeries != nullptr)
            AddSeriesSection(fPage, *fSeries);
        else
            AddMeasurements();
        AddRun();
        AddTerms();
        AddLines("Standard error", fOutcome.fErrorLines);
        std::vector<std::string> lines;
        for (const ReportLine& line : fReport.GetLines())
            lines.push_back(line.fText);
        AddLines("Report lines", lines);
    }

    void AddMeasurements()
    {
        bool isFirst = true;
        for (const KnownKey& key : GetKnownKeys()) {
            if (key.fMatch != Match::kNumber)
                continue;
            const std::vector<Bar> bars = ListBars(key);
            if (bars.empty())
                continue;
            if (isFirst)
                fPage.Add("h2", "Measurements");
            isFirst = false;
            AddBarChart(fPage, fmt::format("{} (more is better)", key.fLabel), bars);
        }
    }

    // Returns a bar for each device that has a measurement to be trusted.
    std::vector<Bar> ListBars(const KnownKey& key) const
    {
        std::vector<Bar> bars;
        for (const DeviceAnswers& device : fAnswers.fDevices) {
            for (const Answer& answer : device.fAnswers) {
                if (answer.fKnown != &key || !answer.IsKnown())
                    continue;
                const auto value = ReadDouble(answer.fLine->fValue);
                if (value && *value > 0)
                    bars.push_back({MakeLabel(device), *value, GetValueText(answer)});
            }
        }
        return bars;
    }

    static std::string MakeLabel(const DeviceAnswers& device)
    {
        return fmt::format("{} {}", device.fTag, ShowBytes(GetDeviceName(device)));
    }

    void AddRow(const char* label, const std::string& value)
    {
        if (value.empty())
            return;
        fPage.Add("dt", label);
        fPage.Add("dd", value);
    }

    void AddRow(const char* label, const Fact& fact)
    {
        AddRow(label, fact.IsKnown() ? ShowBytes(fact.fValue)
                                     : fmt::format("not known ({})", fact.fReason));
    }

    void AddRun()
    {
        fPage.Add("h2", "The run");
        const Element list(fPage, "dl");
        AddRow("Result", GetRunText(fReport, fOutcome));
        AddRow("What happened", ShowBytes(fOutcome.fReason));
        AddRow("Ended by", GetEndText(fOutcome));
        AddRow("Exit status of assay",
               fOutcome.fExitStatus ? std::to_string(*fOutcome.fExitStatus) : "");
        AddRow("Command", GetCommandText(fOutcome));
        AddRow("Time", GetTimeText(fOutcome));
        AddRow("Devices", GetCountText(fAnswers));
        if (!fReport.IsWhole()) {
            AddRow("Last report line", ShowBytes(fOutcome.fLastReportLine));
            AddRow("Last log line", ShowBytes(fOutcome.fLastLogLine));
            AddRow("Next line", ShowBytes(fAnswers.fNext));
        }
        const Environment& environment = fFacts.fEnvironment;
        AddRow("System", environment.fSystem);
        AddRow("Build", environment.fBuild);
        AddRow("Kernel", environment.fKernel);
        AddRow("Architecture", environment.fArchitecture);
        if (environment.fHost.IsKnown())
            AddRow("Host", environment.fHost);
        if (!environment.fTime.empty())
            AddRow("When",
                   fmt::format("{} (local time {})", environment.fTime, environment.fOffset));
        AddRow("Version of assay-host", ShowBytes(fFacts.fHostVersion));
        AddRow("Version of assay", fFacts.fChildVersion);
    }

    // Explains what the cards have.
    void AddTerms()
    {
        if (fAnswers.fDevices.empty())
            return;
        const Element fold(fPage, "details");
        fPage.Add("summary", "What the terms mean");
        const Element list(fPage, "dl");
        for (const KnownKey& key : GetKnownKeys()) {
            const bool isShown = std::any_of(
                fAnswers.fDevices.begin(), fAnswers.fDevices.end(),
                [&key](const DeviceAnswers& device) { return device.fKind == key.fKind; });
            if (!isShown || key.fGroup == KeyGroup::kExtension)
                continue;
            fPage.Add("dt", fmt::format("{}: {}", GetKindName(*key.fKind), key.fLabel));
            fPage.Add("dd", GetExplanation(key).fMeaning);
        }
    }

    void AddLines(const char* title, const std::vector<std::string>& lines)
    {
        if (lines.empty())
            return;
        const Element fold(fPage, "details");
        fPage.Add("summary", fmt::format("{} ({})", title, lines.size()));
        const Element text(fPage, "pre");
        for (const std::string& line : lines) {
            fPage.AddText(ShowBytes(line));
            fPage.AddRaw("\n");
        }
    }

    Markup& fPage;
    const Report& fReport;
    const RunOutcome& fOutcome;
    const RunFacts& fFacts;
    const Series* const fSeries; // null without one
    const Report fTypical;       // with the medians of a series; only with one
    const Answers fAnswers;
};

} // namespace

void WriteReportPage(std::ostream& out, const Report& report, const RunOutcome& outcome,
                     const RunFacts& facts, const Series* series)
{
    Markup page(out);
    ReportPage content(page, report, outcome, facts, series);
    WritePage(
        page, "assay: " + content.GetHeadline(), [&] { content.Add(); },
        [&](std::ostream& json) { WriteDocument(json, report, outcome, facts, series); });
}

} // namespace assay_host
