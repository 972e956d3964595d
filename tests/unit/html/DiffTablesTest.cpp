#include <gtest/gtest.h>

#include <algorithm>
#include <optional>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "html/DiffTables.h"
#include "html/Markup.h"
#include "report/Lines.h"
#include "report/Samples.h"

namespace assay_host {
namespace {

Difference MakeDifference(DiffGroup group, std::optional<std::string> before,
                          std::optional<std::string> after, std::string note = {})
{
    Difference difference;
    difference.fGroup = group;
    difference.fKey = "host";
    difference.fBefore = std::move(before);
    difference.fAfter = std::move(after);
    difference.fNote = std::move(note);
    return difference;
}

std::string Write(const Comparison& comparison)
{
    std::ostringstream out;
    Markup page(out);
    AddDiffTables(page, comparison, "h4");
    return out.str();
}

std::string Write(Difference difference)
{
    Comparison comparison;
    comparison.fDifferences.push_back(std::move(difference));
    return Write(comparison);
}

std::string MakeCell(const std::string& kind, const std::string& text)
{
    return "<td><span class=\"" + kind + "\">" + text + "</span>";
}

TEST(DiffTables, EachGroupHasATitleAndATable)
{
    const std::pair<DiffGroup, const char*> rows[] = {
        {DiffGroup::kRun, "The run"},
        {DiffGroup::kUsable, "What can be used"},
        {DiffGroup::kTrials, "Trials"},
        {DiffGroup::kDevices, "Devices"},
        {DiffGroup::kFacts, "Facts"},
        {DiffGroup::kMeasurements, "Measurements"},
        {DiffGroup::kIdentity, "Name and time"},
        {DiffGroup::kOthers, "Other lines"},
    };
    Comparison comparison;
    std::string expected;
    for (const auto& [group, title] : rows) {
        comparison.fDifferences.push_back(MakeDifference(group, "value", "value"));
        expected += std::string("<h4>") + title +
                    "</h4>\n<table class=\"diff\"><thead><tr><th scope=\"col\">What</th>\n"
                    "<th scope=\"col\">First report</th>\n<th scope=\"col\">Second report</th>\n"
                    "</tr>\n</thead>\n<tbody><tr><th scope=\"row\">Machine</th>\n" +
                    MakeCell("value", "value") + "</td>\n" + MakeCell("value", "value") +
                    "</td>\n</tr>\n</tbody>\n</table>\n";
    }
    EXPECT_EQ(Write(comparison), expected);
    EXPECT_EQ(Write(Comparison()), "");
}

TEST(DiffTables, TheClassOfAValueSaysWhatItIs)
{
    const struct {
        DiffGroup fGroup;
        std::optional<std::string> fValue;
        const char* fClass;
        const char* fText;
    } rows[] = {
        {DiffGroup::kFacts, std::nullopt, "soft", "not known"},
        {DiffGroup::kUsable, std::nullopt, "soft", "not known"},
        {DiffGroup::kUsable, "broken (hung)", "broken", "broken (hung)"},
        {DiffGroup::kUsable, "absent", "absent", "absent"},
        {DiffGroup::kTrials, "yes", "yes", "yes"},
        {DiffGroup::kTrials, "no", "no", "no"},
        {DiffGroup::kTrials, "maybe", "value", "maybe"},
        {DiffGroup::kFacts, "yes", "value", "yes"},
        {DiffGroup::kRun, "no", "value", "no"},
    };
    for (const auto& row : rows) {
        const std::string cell = MakeCell(row.fClass, row.fText) + "</td>";
        EXPECT_NE(Write(MakeDifference(row.fGroup, row.fValue, "other")).find(cell),
                  std::string::npos)
            << cell;
        EXPECT_NE(Write(MakeDifference(row.fGroup, "other", row.fValue)).find(cell),
                  std::string::npos)
            << cell;
    }
}

TEST(DiffTables, ANoteFollowsTheSecondValue)
{
    EXPECT_NE(Write(MakeDifference(DiffGroup::kFacts, "1", "2", "a <note>"))
                  .find(MakeCell("value", "1") + "</td>\n" + MakeCell("value", "2") +
                        " (a &lt;note&gt;)</td>"),
              std::string::npos);
}

TEST(DiffTables, SayWhatAReportDoesNotHave)
{
    const Report report = ReadReport(Sample(1, 0).GetText());
    const Answers answers = GetAnswers(report);
    const DeviceAnswers& device = answers.fDevices.at(0);
    const auto vendor =
        std::find_if(device.fAnswers.begin(), device.fAnswers.end(),
                     [](const Answer& answer) { return answer.fKey == "GLVendor"; });
    const std::string lacks = MakeCell("soft", "not in the report") + "</td>\n";
    Difference ofAnswer;
    ofAnswer.fDeviceBefore = &device;
    ofAnswer.fAnswerBefore = &*vendor;
    EXPECT_NE(Write(ofAnswer).find("Vendor <span class=\"soft\">glgpu[0]</span></th>\n" +
                                   MakeCell("value", "Example Corporation") + "</td>\n" + lacks),
              std::string::npos)
        << Write(ofAnswer);
    Difference ofDevice;
    ofDevice.fGroup = DiffGroup::kDevices;
    ofDevice.fDeviceAfter = &device;
    EXPECT_NE(Write(ofDevice).find("Device <span class=\"soft\">glgpu[0]</span></th>\n" + lacks),
              std::string::npos)
        << Write(ofDevice);
}

TEST(DiffTables, WhatIsTheSameIsFolded)
{
    const Report report = ReadReport(Sample(1, 0).GetText());
    const Report other = ReadReport(Sample(1, 0).Set("glgpu[0].GLMemoryMB", "1024").GetText());
    const Answers before = GetAnswers(report);
    const Answers after = GetAnswers(other);
    const auto find = [](const Answers& answers, const char* key) {
        const std::vector<Answer>& all = answers.fDevices.at(0).fAnswers;
        return &*std::find_if(all.begin(), all.end(),
                              [key](const Answer& answer) { return answer.fKey == key; });
    };
    Comparison comparison;
    comparison.fSame.push_back(
        {&before.fDevices.at(0), find(before, "GLVendor"), find(after, "GLVendor"), ""});
    comparison.fSame.push_back(
        {nullptr, find(before, "GLMemoryMB"), find(after, "GLMemoryMB"), "a note"});
    EXPECT_EQ(Write(comparison), "<details><summary>The same in both reports (2)</summary>\n"
                                 "<dl><dt>glgpu[0] Vendor</dt>\n<dd>Example Corporation</dd>\n"
                                 "<dt>Memory</dt>\n<dd>23.99 GiB, 1 GiB (a note)</dd>\n"
                                 "</dl>\n</details>\n");
}

} // namespace
} // namespace assay_host
