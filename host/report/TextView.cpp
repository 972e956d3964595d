#include "report/TextView.h"

#include <algorithm>
#include <cstddef>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include <fmt/format.h>

#include "report/Answers.h"
#include "report/Bytes.h"
#include "report/LostAnswers.h"
#include "report/NextSteps.h"
#include "report/RunText.h"
#include "report/TextTable.h"
#include "report/Usable.h"
#include "report/ValueText.h"
#include "report/Warnings.h"

namespace assay_host {

namespace {

// The last lines of standard error, and of lines that aren't part of a report, that are shown.
constexpr std::size_t kMaxOtherLines = 10;

std::size_t GetWidth(int width)
{
    constexpr int kMinWidth = 40;
    return static_cast<std::size_t>(std::max(width, kMinWidth));
}

void AppendToList(std::string& list, const std::string& item)
{
    list += list.empty() ? "" : ", ";
    list += item;
}

class DeviceTable {
public:
    explicit DeviceTable(const DeviceAnswers& device) : fDevice(device) {}

    void Print(std::ostream& out, std::size_t width)
    {
        AddMain();
        AddLimits();
        AddExtensions();
        AddOthers();
        AddLost();
        std::string title = fmt::format("{} device {}", GetKindName(fDevice.fKind), fDevice.fTag);
        const std::string name = GetDeviceName(fDevice);
        if (!name.empty())
            title += ": " + ShowBytes(name);
        for (const std::string& line : WrapText(title, width))
            out << line << "\n";
        out << std::string(std::min(CountColumns(title), width), '-') << "\n";
        fTable.Print(out, width);
        out << "\n";
    }

private:
    void AddMain()
    {
        std::multimap<int, const Answer*> rows;
        for (const Answer& answer : fDevice.fAnswers)
            if (answer.fKnown && answer.fKnown->fGroup == KeyGroup::kMain && !IsLost(answer))
                rows.emplace(answer.fKnown->fRow, &answer);
        for (const auto& [row, answer] : rows)
            fTable.Add(GetLabel(*answer), GetValueText(*answer));
    }

    template <typename Action>
    void ForEach(KeyGroup group, Action action)
    {
        for (const Answer& answer : fDevice.fAnswers)
            if (answer.fKnown && answer.fKnown->fGroup == group && answer.fLine)
                action(answer);
    }

    void AddLimits()
    {
        bool isFirst = true;
        ForEach(KeyGroup::kLimit, [&](const Answer& answer) {
            if (isFirst)
                fTable.Add("Limits", "");
            isFirst = false;
            fTable.Add("  " + GetLabel(answer), GetValueText(answer));
        });
    }

    void AddExtensions()
    {
        std::string present;
        std::string absent;
        std::string unclear;
        ForEach(KeyGroup::kExtension, [&](const Answer& answer) {
            const std::string text = GetValueText(answer);
            if (text == "yes")
                AppendToList(present, GetLabel(answer));
            else if (text == "no")
                AppendToList(absent, GetLabel(answer));
            else
                AppendToList(unclear, GetLabel(answer) + "=" + text);
        });
        if (!present.empty())
            fTable.Add("Extensions", present);
        if (!absent.empty())
            fTable.Add("Extensions missing", absent);
        if (!unclear.empty())
            fTable.Add("Extensions, unclear", unclear);
    }

    void AddOthers()
    {
        bool isFirst = true;
        for (const Answer& answer : fDevice.fAnswers) {
            if (answer.fKnown)
                continue;
            if (isFirst)
                fTable.Add("Others", "");
            isFirst = false;
            fTable.Add("  " + GetLabel(answer), GetValueText(answer));
        }
    }

    void AddLost()
    {
        for (const LostAnswers& lost : ListLost(fDevice))
            fTable.Add("No answer",
                       fmt::format("{} ({})", lost.fLabels, GetMissingText(lost.fMissing)));
    }

    const DeviceAnswers& fDevice;
    TextTable fTable;
};

void PrintWarnings(std::ostream& out, const std::vector<Warning>& warnings, std::size_t width)
{
    if (warnings.empty())
        return;
    out << "Warnings\n--------\n";
    TextTable table;
    for (const Warning& warning : warnings)
        table.Add("!", GetWarningText(warning));
    table.Print(out, width);
    out << "\n";
}

// Adds a row for each text, the label beside the first.
void AddRows(TextTable& table, std::string label, const std::vector<std::string>& texts)
{
    for (const std::string& text : texts)
        table.Add(std::exchange(label, ""), text);
}

// Adds the last lines under one label.
void AddLines(TextTable& table, const std::string& label, const std::vector<std::string>& lines)
{
    std::string first = label;
    const std::size_t left = lines.size() - std::min(lines.size(), kMaxOtherLines);
    if (left > 0)
        table.Add(std::exchange(first, ""), fmt::format("({} earlier lines)", left));
    for (std::size_t line = left; line < lines.size(); ++line) {
        const std::string text = ShowBytes(lines[line]);
        table.Add(std::exchange(first, ""), text.empty() ? "(empty)" : text);
    }
}

bool HasValues(const Report& report)
{
    const std::vector<ReportLine>& lines = report.GetLines();
    return std::any_of(lines.begin(), lines.end(),
                       [](const ReportLine& line) { return line.fKind == LineKind::kValue; });
}

void PrintRun(std::ostream& out, const Report& report, const Answers& answers,
              const RunOutcome& outcome, std::size_t width)
{
    const std::string title = fmt::format("Run: {}", GetRunText(report, outcome));
    out << title << "\n" << std::string(title.size(), '-') << "\n";
    TextTable table;
    const auto add = [&table](const char* label, const std::string& value) {
        if (!value.empty())
            table.Add(label, value);
    };
    add("What happened", ShowBytes(outcome.fReason));
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL})
        add(GetKindName(kind), GetUsableText(JudgeUsable(kind, answers, outcome)));
    AddRows(table, "What to do", GetNextSteps(answers, outcome));
    add("Ended by", GetEndText(outcome));
    add("Exit status of assay", outcome.fExitStatus ? std::to_string(*outcome.fExitStatus) : "");
    add("Command", GetCommandText(outcome));
    add("Time", GetTimeText(outcome));
    if (HasValues(report))
        add("Devices", GetCountText(answers));
    if (HasValues(report) && !report.IsWhole()) {
        add("Last report line", ShowBytes(outcome.fLastReportLine));
        add("Last log line", ShowBytes(outcome.fLastLogLine));
        add("Next line", ShowBytes(answers.fNext));
    }
    AddLines(table, "Standard error", outcome.fErrorLines);
    AddLines(table, "Other lines", GetRawLines(report));
    table.Print(out, width);
}

} // namespace

void PrintText(std::ostream& out, const Report& report, const RunOutcome& outcome, int width)
{
    const std::size_t columns = GetWidth(width);
    const Answers answers = GetAnswers(report, outcome);
    PrintWarnings(out, GetWarnings(answers, outcome), columns);
    for (const DeviceAnswers& device : answers.fDevices)
        DeviceTable(device).Print(out, columns);
    PrintRun(out, report, answers, outcome, columns);
}

} // namespace assay_host
