#include "bugreport/BugReport.h"

#include <algorithm>
#include <iterator>
#include <sstream>
#include <string_view>
#include <utility>

#include <fmt/format.h>

#include "report/JsonDocument.h"
#include "report/LogFilter.h"
#include "report/TextView.h"

namespace assay_host {

namespace {

constexpr int kWidth = 80;

std::string JoinLines(const std::vector<std::string>& lines)
{
    std::string text;
    for (const std::string& line : lines)
        text += line + "\n";
    return text;
}

std::string GetFactText(const Fact& fact)
{
    return fact.IsKnown() ? fact.fValue : fmt::format("not known ({})", fact.fReason);
}

std::string MakeSummary(const BugReportData& data)
{
    std::ostringstream out;
    PrintText(out, data.fReport, data.fOutcome, kWidth);
    return out.str();
}

std::string MakeLog(const BugReportData& data)
{
    std::string text = JoinLines(data.fLog);
    if (!data.fOutcome.fErrorLines.empty())
        text += "\nStandard error:\n" + JoinLines(data.fOutcome.fErrorLines);
    return text;
}

std::string MakeDocument(const BugReportData& data)
{
    std::ostringstream out;
    WriteDocument(out, data.fReport, data.fOutcome, data.fFacts);
    return out.str();
}

std::string MakeSystem(const BugReportData& data)
{
    const Environment& environment = data.fFacts.fEnvironment;
    std::string text =
        fmt::format("assay-host    {}\nassay         {}\nsystem        {}\nbuild         {}\n"
                    "kernel        {}\narchitecture  {}\ntime          {}\n",
                    data.fFacts.fHostVersion, GetFactText(data.fFacts.fChildVersion),
                    GetFactText(environment.fSystem), GetFactText(environment.fBuild),
                    GetFactText(environment.fKernel), GetFactText(environment.fArchitecture),
                    environment.fTime);
    text += "\nVariables that select drivers:\n";
    return text + (data.fIdentity.fVariables.empty() ? "none is set\n"
                                                     : JoinLines(data.fIdentity.fVariables));
}

// Whether the child's log line is about the system's lists of adapters.
bool IsAdapterLine(std::string_view line)
{
    if (!IsLogLine(line))
        return false;
    const std::string_view text = GetLogText(line);
    const auto startsWith = [text](std::string_view start) {
        return text.substr(0, start.size()) == start;
    };
    return startsWith("wmi") || startsWith("dxgi") || startsWith("qgf") ||
           text.find("WMI") != std::string_view::npos ||
           text.find("DXGI") != std::string_view::npos;
}

std::string MakeAdapters(const BugReportData& data)
{
    std::string text = "The system's list:\n";
    for (const AdapterIdentity& adapter : data.fIdentity.fAdapters)
        text +=
            fmt::format("{} vendor 0x{:04X} device 0x{:04X} driver {} {}\n", adapter.fSlot,
                        adapter.fVendor, adapter.fDevice,
                        adapter.fDriver.empty() ? "none" : adapter.fDriver, adapter.fDriverVersion);
    if (data.fIdentity.fAdapters.empty())
        text += "no adapter\n";
    text += "\nIn the log of assay:\n";
    std::vector<std::string> lines;
    std::copy_if(data.fLog.begin(), data.fLog.end(), std::back_inserter(lines), IsAdapterLine);
    return text + (lines.empty() ? "nothing\n" : JoinLines(lines));
}

std::string MakeDrivers(const BugReportData& data)
{
    std::string text = "Loaded by assay:\n";
    const LoadedFiles& loaded = data.fOutcome.fDrivers;
    if (!loaded.IsKnown())
        text += fmt::format("not known ({})\n", loaded.fReason);
    for (const LoadedFile& file : loaded.fFiles)
        text += fmt::format("{} {}\n  version {}, build id {}\n", GetKindName(file.fInterface),
                            file.fPath, GetFactText(file.fVersion), GetFactText(file.fBuildId));
    text += "\nTo be loaded, as the system is set up:\n";
    for (const DriverFile& file : data.fIdentity.fFiles)
        text += fmt::format("{} {}\n  {} bytes, build id {}\n", GetKindName(file.fInterface),
                            file.fPath, file.fSize,
                            file.fBuildId.empty() ? "not known" : file.fBuildId);
    return text;
}

std::string MakeKernel(const BugReportData& data)
{
    if (!data.fKernel.fReason.empty())
        return fmt::format("not known ({})\n", data.fKernel.fReason);
    return data.fKernel.fLines.empty() ? "no message is about graphics\n"
                                       : JoinLines(data.fKernel.fLines);
}

struct Part {
    const char* fName;
    const char* fWhat;
    std::string (*fMake)(const BugReportData& data);
    std::string (*fGetReason)(const BugReportData& data);
};

std::string GetNoReason(const BugReportData& /*data*/)
{
    return {};
}

constexpr Part kParts[] = {
    {"summary.txt", "the run as text: what works, and what to do", &MakeSummary, &GetNoReason},
    {"report.txt", "each line of assay with its log, and standard error", &MakeLog,
     [](const BugReportData& data) {
         return std::string(data.fLog.empty() ? "assay printed nothing" : "");
     }},
    {"report.json", "the run for programs; assay-host show makes any form of it", &MakeDocument,
     &GetNoReason},
    {"system.txt", "versions of the programs, the system and the kernel", &MakeSystem,
     &GetNoReason},
    {"adapters.txt", "the system's lists of graphics adapters", &MakeAdapters, &GetNoReason},
    {"drivers.txt", "the files of the drivers, with their versions", &MakeDrivers,
     [](const BugReportData& data) { return data.fOutcome.fDrivers.fReason; }},
    {"kernel.txt", "messages of the kernel about graphics", &MakeKernel,
     [](const BugReportData& data) { return data.fKernel.fReason; }},
};
constexpr char kReadme[] = "README.txt";
constexpr char kReadmeWhat[] = "what the archive has, and what is missing";

std::string MakeReadme(const std::vector<BugReportFile>& files, const BugReportData& data)
{
    std::string text = fmt::format("A bug report by assay-host {}, {}.\n\n",
                                   data.fFacts.fHostVersion, data.fFacts.fEnvironment.fTime);
    std::string missing;
    for (const BugReportFile& file : files) {
        text += fmt::format("{:<12}  {}\n", file.fName, file.fWhat);
        if (!file.fReason.empty())
            missing += fmt::format("{:<12}  {}\n", file.fName, file.fReason);
    }
    text += "\nMissing:\n" + (missing.empty() ? "nothing\n" : missing);
    return text +
           "\nHOST stands for the names of the machine, USER for those of the user, HOME for "
           "the\npaths of home folders. Driver texts may have other private words: read the "
           "files\nbefore you pass them on.\n";
}

} // namespace

const std::vector<BugReportFile>& ListBugReport()
{
    static const std::vector<BugReportFile> list = [] {
        std::vector<BugReportFile> files = {{kReadme, kReadmeWhat, {}, {}}};
        for (const Part& part : kParts)
            files.push_back({part.fName, part.fWhat, {}, {}});
        return files;
    }();
    return list;
}

std::vector<BugReportFile> MakeBugReport(BugReportData data, const Mask& mask)
{
    mask.ApplyTo(data.fReport);
    mask.ApplyTo(data.fOutcome);
    mask.ApplyTo(data.fFacts);
    mask.ApplyTo(data.fIdentity);
    for (std::vector<std::string>* const lines : {&data.fLog, &data.fKernel.fLines})
        for (std::string& line : *lines)
            line = mask.Apply(line);
    data.fKernel.fReason = mask.Apply(data.fKernel.fReason);
    std::vector<BugReportFile> files;
    for (const Part& part : kParts)
        files.push_back({part.fName, part.fWhat, part.fMake(data), part.fGetReason(data)});
    std::string readme = MakeReadme(files, data);
    files.insert(files.begin(), {kReadme, kReadmeWhat, std::move(readme), {}});
    return files;
}

} // namespace assay_host
