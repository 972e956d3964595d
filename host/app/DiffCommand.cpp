#include <sstream>

#include "app/Commands.h"
#include "app/Output.h"
#include "report/Diff.h"
#include "report/ReportFile.h"

namespace assay_host {

int Diff(const DiffChoice& choice)
{
    const Report before = LoadReport(choice.fBefore);
    const Report after = LoadReport(choice.fAfter);
    DiffOptions options;
    options.fTolerance = choice.fTolerance;
    std::ostringstream text;
    const bool differs = PrintDiff(text, before, after, options);
    const std::unique_ptr<Output> output = OpenStandardOutput();
    output->Write(text.str());
    return differs ? kDifferentStatus : 0;
}

} // namespace assay_host
