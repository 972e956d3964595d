#include <cstdio>
#include <memory>
#include <stdexcept>
#include <string>

#include <fmt/format.h>

#include "app/Checker.h"
#include "app/Commands.h"
#include "app/FindAssay.h"
#include "app/ValueCollector.h"
#include "output/Delivery.h"
#include "output/Output.h"
#include "output/WriterThread.h"
#include "report/Bytes.h"
#include "report/ReportFile.h"
#include "report/RunOutcome.h"
#include "series/MedianReport.h"
#include "supervise/ChildRun.h"
#include "supervise/Guardian.h"
#include "supervise/Interrupt.h"

namespace assay_host {

namespace {

int CheckReports(const CheckChoice& choice)
{
    Checker checker(choice);
    bool isMet = true;
    bool isRead = true;
    for (const std::string& path : choice.fReports) {
        try {
            const StoredRun run = LoadRun(path);
            const std::string prefix = choice.fReports.size() > 1 ? ShowBytes(path) + ": " : "";
            isMet = checker.CheckReport(GetTypicalReport(run), run.fOutcome, prefix) && isMet;
        } catch (const std::runtime_error& failure) {
            // The other files are checked all the same.
            std::fprintf(stderr, "assay-host: %s\n", ShowBytes(failure.what()).c_str());
            isRead = false;
        }
    }
    OpenStandardOutput()->Write(checker.GetText());
    if (!isRead)
        return kErrorStatus;
    return isMet ? 0 : kUnmetStatus;
}

int CheckRun(const CheckChoice& choice)
{
    Checker checker(choice);
    GuardProcess();
    const auto stop = std::make_shared<pmutil::StopRequest>();
    WatchForInterrupt(stop);
    ChildOptions options = MakeChildOptions(choice.fChild);
    options.fKeepCauses = true;
    ValueCollector collector;
    const RunOutcome outcome = RunChild(options, collector, *stop);
    // The run is over, and Finish() throws a failure of the output.
    const auto writer = std::make_shared<WriterThread>(OpenStandardOutput(), [] {});
    const Delivery delivery(writer);
    const bool isComplete = outcome.fVerdict == Verdict::kComplete;
    if (!isComplete)
        checker.AddLine(fmt::format("{}: {}", GetVerdictName(outcome.fVerdict), outcome.fReason));
    const bool isMet = checker.CheckReport(collector.fReport, outcome, "");
    writer->Write(checker.GetText());
    delivery.Finish();
    if (!isComplete)
        return GetVerdictStatus(outcome.fVerdict);
    return isMet ? 0 : kUnmetStatus;
}

} // namespace

int Check(const CheckChoice& choice)
{
    if (!choice.fState.empty())
        return CheckState(choice);
    return choice.fReports.empty() ? CheckRun(choice) : CheckReports(choice);
}

} // namespace assay_host
