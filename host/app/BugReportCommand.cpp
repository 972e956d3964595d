#include <algorithm>
#include <cstdio>
#include <iostream>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <fmt/format.h>

#include "app/Commands.h"
#include "app/FindAssay.h"
#include "bugreport/Archive.h"
#include "bugreport/BugReport.h"
#include "facts/DescribeFiles.h"
#include "facts/Environment.h"
#include "facts/FileVersion.h"
#include "output/Output.h"
#include "output/Terminal.h"
#include "report/Bytes.h"
#include "supervise/ChildRun.h"
#include "supervise/Guardian.h"
#include "supervise/Interrupt.h"

namespace assay_host {

namespace {

class Collector : public RunObserver {
public:
    void OnLine(const ReportLine& line, double /*seconds*/) override
    {
        fReport.Add(line);
        fLog.push_back(line.fText);
    }

    // The log may be longer than any report; what matters is its end.
    void OnLogLine(const std::string& line, double /*seconds*/) override { fLog.push_back(line); }

    Report fReport;
    std::vector<std::string> fLog;
};

void Print(const std::string& text)
{
    OpenStandardOutput()->Write(text);
}

// "assay-bugreport-20261122T142526Z"
std::string MakeName(std::string time)
{
    time.erase(std::remove_if(time.begin(), time.end(),
                              [](char character) { return character == '-' || character == ':'; }),
               time.end());
    return "assay-bugreport-" + time;
}

std::string DescribeArchive(const std::string& path)
{
    std::string text = fmt::format("{} will have:\n", ShowBytes(path));
    for (const BugReportFile& file : ListBugReport())
        text += fmt::format("  {:<12}  {}\n", file.fName, file.fWhat);
    return text + "The names of this machine and of its user and the paths of home folders are "
                  "masked.\n";
}

// Returns false if the user declines. Without a terminal there is nobody to ask.
bool Ask()
{
    if (!IsInputTerminal())
        throw std::runtime_error(
            "standard input is no terminal to ask on; --yes writes the archive without asking");
    std::fputs("Write it? [y/N] ", stderr);
    std::string answer;
    std::getline(std::cin, answer);
    return answer == "y" || answer == "Y" || answer == "yes";
}

BugReportData Collect(const BugReportChoice& choice, RunFacts facts, pmutil::StopRequest& stop)
{
    ChildOptions options = MakeChildOptions(choice.fChild);
    options.fKeepCauses = true;
    Collector collector;
    BugReportData data;
    data.fFacts = std::move(facts);
    data.fFacts.fChildVersion = GetFileVersion(options.fProgram);
    data.fOutcome = RunChild(options, collector, stop);
    if (data.fOutcome.fVerdict == Verdict::kInterrupted)
        return data;
    DescribeFiles(data.fOutcome.fDrivers.fFiles);
    data.fReport = std::move(collector.fReport);
    data.fLog = std::move(collector.fLog);
    data.fIdentity = GetIdentity(options.fProgram);
    // After the run, so that messages about its crash are there.
    data.fKernel = ReadKernelLog();
    return data;
}

} // namespace

int BugReport(const BugReportChoice& choice)
{
    RunFacts facts;
    facts.fHostVersion = ASSAY_VERSION;
    facts.fEnvironment = GetEnvironment(false);
    const std::string time = facts.fEnvironment.fTime;
    const std::string name = MakeName(time);
    const std::string path = choice.fOutput.empty() ? name + ".zip" : choice.fOutput;
    Print(DescribeArchive(path));
    OpenNewFile(path); // fails before the run if it would fail after it
    if (!choice.fYes && !Ask()) {
        Print("Nothing was written.\n");
        return kDeclinedStatus;
    }
    GuardProcess();
    const auto stop = std::make_shared<pmutil::StopRequest>();
    WatchForInterrupt(stop);
    BugReportData data = Collect(choice, std::move(facts), *stop);
    if (data.fOutcome.fVerdict == Verdict::kInterrupted)
        return GetVerdictStatus(Verdict::kInterrupted);
    const std::vector<BugReportFile> files = MakeBugReport(std::move(data), Mask(ListSecrets()));
    std::vector<ArchiveFile> packed;
    std::string list;
    for (const BugReportFile& file : files) {
        packed.push_back({name + "/" + file.fName, file.fText});
        list += fmt::format("  {:<12}  {} bytes{}\n", file.fName, file.fText.size(),
                            file.fReason.empty() ? "" : "; not known: " + ShowBytes(file.fReason));
    }
    const std::unique_ptr<Output> output = OpenNewFile(path);
    output->Open();
    output->Write(MakeArchive(packed, time));
    output->Finish();
    // The reader of the output may not read.
    SetInterruptEnd([] { EndProcess(GetVerdictStatus(Verdict::kInterrupted)); });
    Print(fmt::format("{} was written:\n{}", ShowBytes(path), list));
    return 0;
}

} // namespace assay_host
