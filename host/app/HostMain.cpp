#include "app/HostMain.h"

#include <cstdio>
#include <exception>
#include <string>
#include <vector>

#include <boost/nowide/args.hpp>

#include "app/CommandLine.h"
#include "app/Commands.h"
#include "output/Output.h"
#include "pmutil/System.h"
#include "pmutil/UTF8Console.h"
#include "report/Bytes.h"
#include "report/RunOutcome.h"
#include "supervise/ErrorDialogs.h"
#include "supervise/Interrupt.h"

namespace assay_host {

namespace {

int Act(const RunChoice& choice)
{
    return Run(choice);
}

int Act(const TortureChoice& choice)
{
    return Torture(choice);
}

int Act(const DiffChoice& choice)
{
    return Diff(choice);
}

int Act(const ShowChoice& choice)
{
    return Show(choice);
}

int Act(const ExplainChoice& choice)
{
    return Explain(choice);
}

int Act(const CheckChoice& choice)
{
    return Check(choice);
}

int Act(const AdviseChoice& choice)
{
    return Advise(choice);
}

int Act(const StateChoice& choice)
{
    return State(choice);
}

int Act(const BugReportChoice& choice)
{
    return BugReport(choice);
}

int RunMain(const std::vector<std::string>& words)
{
    const Parsed parsed = ParseCommandLine(words);
    if (parsed.fChoice)
        return std::visit([](const auto& choice) { return Act(choice); }, *parsed.fChoice);
    if (parsed.fStatus == 0)
        OpenStandardOutput()->Write(parsed.fText);
    else
        std::fputs(parsed.fText.c_str(), stderr);
    return parsed.fStatus;
}

} // namespace

int RunHost(int argc, char** argv)
{
    pmutil::PrepareConsoleProcess();
    PrepareSignals();
    KeepDialogsAway();
    const pmutil::UTF8Console console;
    try {
        const boost::nowide::args utf8(argc, argv);
        return RunMain(std::vector<std::string>(argv + 1, argv + argc));
    } catch (const std::exception& exc) {
        SetInterruptEnd([] { EndProcess(GetVerdictStatus(Verdict::kInterrupted)); });
        std::fprintf(stderr, "assay-host: %s\n", ShowBytes(exc.what()).c_str());
        const bool isDiff = argc > 1 && std::string(argv[1]) == "diff";
        return isDiff ? kDiffErrorStatus : kErrorStatus;
    }
}

} // namespace assay_host
