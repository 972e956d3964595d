#include <ostream>

#include "app/Commands.h"
#include "output/Output.h"
#include "output/SinkBuffer.h"
#include "report/Diff.h"
#include "report/ReportFile.h"

namespace assay_host {

int Diff(const DiffChoice& choice)
{
    const Report before = LoadReport(choice.fBefore);
    const Report after = LoadReport(choice.fAfter);
    DiffOptions options;
    options.fTolerance = choice.fTolerance;
    const std::unique_ptr<Output> output = OpenStandardOutput();
    SinkBuffer buffer([&output](std::string_view block) { output->Write(block); });
    std::ostream text(&buffer);
    text.exceptions(std::ios::badbit);
    const bool differs = PrintDiff(text, before, after, options);
    text.flush();
    return differs ? kDifferentStatus : 0;
}

} // namespace assay_host
