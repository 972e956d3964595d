// The whole text of each file of a bug report, of a rich run and of one that has nothing.
#include "bugreport/BugReport.h"

#include <map>
#include <sstream>

#include <gtest/gtest.h>

#include "Lines.h"
#include "Samples.h"
#include "report/JsonDocument.h"
#include "report/TextView.h"

namespace assay_host {
namespace {

std::map<std::string, std::string> MakeTexts(const BugReportData& data)
{
    std::map<std::string, std::string> texts;
    for (const BugReportFile& file : MakeBugReport(data, Mask({})))
        texts[file.fName] = file.fText;
    return texts;
}

std::string MakeLogLine(const std::string& text)
{
    return "# 00001.2026.11.22_14:25:26.000(+00.000)[tid=1] " + text;
}

BugReportData MakeRichData()
{
    BugReportData data;
    data.fReport = ReadReport(Sample(1, 1).GetText());
    data.fOutcome.fVerdict = Verdict::kCrashed;
    data.fOutcome.fCommand = {"assay"};
    for (int word = 1; word < 60; ++word)
        data.fOutcome.fReason += std::string(static_cast<std::size_t>(word % 7), 'x') + " y ";
    data.fOutcome.fErrorLines = {"first", "second"};
    data.fOutcome.fDrivers = {{{DeviceKind::kOpenGL, "/lib/a.so", {"1.1", {}}, {"00ff", {}}},
                               {DeviceKind::kOpenCL, "/lib/b.so", {{}, "no"}, {{}, "none"}}},
                              {}};
    data.fFacts.fHostVersion = "1.0.0";
    data.fFacts.fChildVersion = {"1.0.1", {}};
    data.fFacts.fEnvironment = {{"Debian", {}}, {{}, "no build"},  {"Linux 6.1", {}},
                                {"x86_64", {}}, {{}, "not asked"}, "2026-11-22T14:25:26Z",
                                "+01:00"};
    data.fLog = {"Tester=\"Pixmere\"", MakeLogLine("wmiNumDevices=1"), MakeLogLine("other")};
    data.fIdentity.fAdapters = {{"0000:01:00.0", 0x10DE, 0x84, "nvidia", "550.1"},
                                {"0000:02:00.0", 0xABC, 0x2684, "", "x"}};
    data.fIdentity.fFiles = {{DeviceKind::kOpenCL, "/etc/a.icd", 7, 0, ""},
                             {DeviceKind::kOpenGL, "/lib/c.so", 4096, 0, "abcd"}};
    data.fIdentity.fVariables = {"A=1", "B=2"};
    data.fKernel.fLines = {"[    1.000000] [drm] x", "[    2.000000] gpu"};
    return data;
}

std::string PrintSummary(const BugReportData& data, int width)
{
    std::ostringstream out;
    PrintText(out, data.fReport, data.fOutcome, width);
    return out.str();
}

constexpr char kReadmeList[] =
    "summary.txt   the run as text: what works, and what to do\n"
    "report.txt    each line of assay with its log, and standard error\n"
    "report.json   the run for programs; assay-host show makes any form of it\n"
    "system.txt    versions of the programs, the system and the kernel\n"
    "adapters.txt  the system's lists of graphics adapters\n"
    "drivers.txt   the files of the drivers, with their versions\n"
    "kernel.txt    messages of the kernel about graphics\n"
    "\nMissing:\n";
constexpr char kReadmeEnd[] =
    "\nHOST stands for the names of the machine, USER for those of the user, HOME for the\n"
    "paths of home folders. Driver texts may have other private words: read the files\n"
    "before you pass them on.\n";

TEST(BugReportText, OfARichRun)
{
    const BugReportData data = MakeRichData();
    std::map<std::string, std::string> texts = MakeTexts(data);
    EXPECT_EQ(texts["README.txt"],
              std::string("A bug report by assay-host 1.0.0, 2026-11-22T14:25:26Z.\n\n") +
                  kReadmeList + "nothing\n" + kReadmeEnd);
    EXPECT_EQ(texts["report.txt"],
              "Tester=\"Pixmere\"\n"
              "# 00001.2026.11.22_14:25:26.000(+00.000)[tid=1] wmiNumDevices=1\n"
              "# 00001.2026.11.22_14:25:26.000(+00.000)[tid=1] other\n"
              "\nStandard error:\nfirst\nsecond\n");
    EXPECT_EQ(texts["system.txt"], "assay-host    1.0.0\n"
                                   "assay         1.0.1\n"
                                   "system        Debian\n"
                                   "build         not known (no build)\n"
                                   "kernel        Linux 6.1\n"
                                   "architecture  x86_64\n"
                                   "time          2026-11-22T14:25:26Z\n"
                                   "\nVariables that select drivers:\nA=1\nB=2\n");
    EXPECT_EQ(texts["adapters.txt"],
              "The system's list:\n"
              "0000:01:00.0 vendor 0x10DE device 0x0084 driver nvidia 550.1\n"
              "0000:02:00.0 vendor 0x0ABC device 0x2684 driver none x\n"
              "\nIn the log of assay:\n"
              "# 00001.2026.11.22_14:25:26.000(+00.000)[tid=1] wmiNumDevices=1\n");
    EXPECT_EQ(texts["drivers.txt"],
              "Loaded by assay:\n"
              "OpenGL /lib/a.so\n  version 1.1, build id 00ff\n"
              "OpenCL /lib/b.so\n  version not known (no), build id not known (none)\n"
              "\nTo be loaded, as the system is set up:\n"
              "OpenCL /etc/a.icd\n  7 bytes, build id not known\n"
              "OpenGL /lib/c.so\n  4096 bytes, build id abcd\n");
    EXPECT_EQ(texts["kernel.txt"], "[    1.000000] [drm] x\n[    2.000000] gpu\n");
}

TEST(BugReportText, OfARunThatHasNothing)
{
    BugReportData data;
    data.fFacts.fChildVersion = {{}, "no file"};
    std::map<std::string, std::string> texts = MakeTexts(data);
    EXPECT_EQ(texts["README.txt"], std::string("A bug report by assay-host , .\n\n") + kReadmeList +
                                       "report.txt    assay printed nothing\n"
                                       "drivers.txt   the child was not started\n" +
                                       kReadmeEnd);
    EXPECT_EQ(texts["report.txt"], "");
    EXPECT_EQ(texts["system.txt"], "assay-host    \n"
                                   "assay         not known (no file)\n"
                                   "system        \nbuild         \nkernel        \n"
                                   "architecture  \ntime          \n"
                                   "\nVariables that select drivers:\nnone is set\n");
    EXPECT_EQ(texts["adapters.txt"],
              "The system's list:\nno adapter\n\nIn the log of assay:\nnothing\n");
    EXPECT_EQ(texts["drivers.txt"], "Loaded by assay:\nnot known (the child was not started)\n"
                                    "\nTo be loaded, as the system is set up:\n");
    EXPECT_EQ(texts["kernel.txt"], "no message is about graphics\n");
}

TEST(BugReportText, TheSummaryIsTheTextOfTheRunForAnUsualTerminal)
{
    const BugReportData data = MakeRichData();
    const std::string summary = MakeTexts(data)["summary.txt"];
    EXPECT_EQ(summary, PrintSummary(data, 80));
    EXPECT_NE(summary, PrintSummary(data, 79));
    EXPECT_NE(summary, PrintSummary(data, 81));
}

TEST(BugReportText, TheReportForProgramsIsTheDocumentOfTheRun)
{
    const BugReportData data = MakeRichData();
    std::ostringstream out;
    WriteDocument(out, data.fReport, data.fOutcome, data.fFacts);
    EXPECT_EQ(MakeTexts(data)["report.json"], out.str());
}

TEST(BugReportText, OnlyLogLinesAboutTheSystemsListsAreAmongTheAdapters)
{
    const struct {
        std::string fLine;
        bool fIsThere;
    } lines[] = {
        {MakeLogLine("wmiNumDevices=1"), true},
        {MakeLogLine("dxgi adapter 0"), true},
        {MakeLogLine("qgf device 0"), true},
        {MakeLogLine("WMI failed"), true},
        {MakeLogLine("BEGIN WMIData::x"), true},
        {MakeLogLine("DXGI failed"), true},
        {MakeLogLine("BEGIN DXGIData::x"), true},
        {MakeLogLine("no wmi"), false},
        {MakeLogLine("no dxgi"), false},
        {MakeLogLine("no qgf"), false},
        {MakeLogLine("wm"), false},
        {MakeLogLine(""), false},
        {"wmiNumDevices=1", false},
        {"WMI", false},
        {"# DXGI", false},
    };
    for (const auto& line : lines) {
        BugReportData data;
        data.fLog = {line.fLine};
        EXPECT_EQ(MakeTexts(data)["adapters.txt"],
                  "The system's list:\nno adapter\n\nIn the log of assay:\n" +
                      (line.fIsThere ? line.fLine + "\n" : "nothing\n"))
            << line.fLine;
    }
}

TEST(BugReportText, TheListHasTheFilesInTheirOrder)
{
    std::string list;
    for (const BugReportFile& file : ListBugReport()) {
        EXPECT_EQ(file.fText + file.fReason, "") << file.fName;
        list += file.fName + ": " + file.fWhat + "\n";
    }
    EXPECT_EQ(list, "README.txt: what the archive has, and what is missing\n"
                    "summary.txt: the run as text: what works, and what to do\n"
                    "report.txt: each line of assay with its log, and standard error\n"
                    "report.json: the run for programs; assay-host show makes any form of it\n"
                    "system.txt: versions of the programs, the system and the kernel\n"
                    "adapters.txt: the system's lists of graphics adapters\n"
                    "drivers.txt: the files of the drivers, with their versions\n"
                    "kernel.txt: messages of the kernel about graphics\n");
}

} // namespace
} // namespace assay_host
