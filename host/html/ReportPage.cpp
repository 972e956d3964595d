#include "html/ReportPage.h"

#include <algorithm>
#include <iterator>
#include <streambuf>
#include <string>
#include <vector>

#include <fmt/format.h>

#include "html/Assets.h"
#include "html/BarChart.h"
#include "html/DeviceCard.h"
#include "html/Markup.h"
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

namespace assay_host {

namespace {

// Passes JSON on in a form that can't end the element around it: "<" only occurs in its strings.
class ScriptBuffer : public std::streambuf {
public:
    explicit ScriptBuffer(std::ostream& out) : fOut(out) {}

protected:
    int_type overflow(int_type character) override
    {
        if (traits_type::eq_int_type(character, traits_type::eof()))
            return traits_type::not_eof(character);
        const char byte = traits_type::to_char_type(character);
        return xsputn(&byte, 1) == 1 ? character : traits_type::eof();
    }

    std::streamsize xsputn(const char* bytes, std::streamsize count) override
    {
        std::string_view rest(bytes, static_cast<std::size_t>(count));
        while (!rest.empty()) {
            const std::size_t at = std::min(rest.find('<'), rest.size());
            fOut << rest.substr(0, at);
            if (at < rest.size())
                fOut << "\\u003C";
            rest.remove_prefix(std::min(at + 1, rest.size()));
        }
        return count;
    }

private:
    std::ostream& fOut;
};

class ReportPage {
public:
    ReportPage(std::ostream& out, const Report& report, const RunOutcome& outcome,
               const RunFacts& facts)
        : fPage(out),
          fReport(report),
          fOutcome(outcome),
          fFacts(facts),
          fAnswers(GetAnswers(report))
    {}

    void Write()
    {
        fPage.AddRaw("<!DOCTYPE html>\n");
        const Element html(fPage, "html", {{"lang", "en"}});
        AddHead();
        const Element body(fPage, "body");
        AddHeader();
        AddMain();
        AddFooter();
        // After all else, so that a reader waits for nothing.
        AddJson();
    }

private:
    void AddHead()
    {
        const Element head(fPage, "head");
        fPage.AddVoid("meta", {{"charset", "utf-8"}});
        fPage.AddVoid(
            "meta",
            {{"http-equiv", "Content-Security-Policy"},
             {"content", fmt::format("default-src 'none'; style-src 'unsafe-inline'; script-src "
                                     "'{}'; base-uri 'none'; form-action 'none'",
                                     kCopyScriptHash)}});
        fPage.AddVoid("meta",
                      {{"name", "viewport"}, {"content", "width=device-width, initial-scale=1"}});
        fPage.Add("title", "assay: " + GetHeadline());
        const Element style(fPage, "style");
        fPage.AddRaw(kPageStyle);
    }

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
        AddList("What to do", GetNextSteps(fAnswers, fOutcome));
        std::vector<std::string> warnings;
        for (const Warning& warning : GetWarnings(fAnswers, fOutcome))
            warnings.push_back(GetWarningText(warning));
        AddList("Warnings", warnings);
    }

    // What the run shows. A whole report says nothing about what a host can do with the machine.
    std::string GetHeadline() const
    {
        return fOutcome.fVerdict == Verdict::kComplete
                   ? JudgeUsable(DeviceKind::kOpenGL, fAnswers, fOutcome).fText
                   : ShowBytes(fOutcome.fReason);
    }

    void AddList(const char* title, const std::vector<std::string>& items)
    {
        if (items.empty())
            return;
        fPage.Add("h2", title);
        const Element list(fPage, "ul");
        for (const std::string& item : items)
            fPage.Add("li", item);
    }

    void AddMain()
    {
        const Element main(fPage, "main");
        if (!fAnswers.fDevices.empty()) {
            const Element devices(fPage, "div", {{"class", "devices"}});
            for (const DeviceAnswers& device : fAnswers.fDevices)
                AddDeviceCard(fPage, device);
        }
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

    void AddFooter()
    {
        const Element footer(fPage, "footer");
        const Element line(fPage, "p", {{"class", "soft"}});
        fPage.AddText("Made by assay-host. ");
        fPage.Add("button", "Copy as JSON", {{"id", "copy"}, {"hidden", ""}});
        fPage.Add("span", "", {{"id", "copied"}, {"role", "status"}});
    }

    void AddJson()
    {
        {
            const Element json(fPage, "script", {{"type", "application/json"}, {"id", "json"}});
            ScriptBuffer buffer(fPage.GetStream());
            std::ostream document(&buffer);
            WriteDocument(document, fReport, fOutcome, fFacts);
        }
        const Element script(fPage, "script");
        fPage.AddRaw(kCopyScript);
    }

    Markup fPage;
    const Report& fReport;
    const RunOutcome& fOutcome;
    const RunFacts& fFacts;
    const Answers fAnswers;
};

} // namespace

void WriteReportPage(std::ostream& out, const Report& report, const RunOutcome& outcome,
                     const RunFacts& facts)
{
    ReportPage(out, report, outcome, facts).Write();
}

} // namespace assay_host
