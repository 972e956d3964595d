#include "app/Forms.h"

#include "fleet/AnsibleFacts.h"
#include "fleet/NodeFeatures.h"
#include "fleet/PrometheusText.h"
#include "html/ReportPage.h"
#include "report/JsonDocument.h"
#include "report/TextView.h"
#include "series/MedianReport.h"
#include "series/SeriesView.h"

namespace assay_host {

namespace {

// Writes a form that shows the report as it came, and the series in a part of its own.
void WriteExact(std::ostream& out, const Form& form, const StoredRun& run)
{
    const Series* const series = run.fSeries ? &*run.fSeries : nullptr;
    if (form.fFormat == Format::kHtml)
        WriteReportPage(out, run.fReport, run.fOutcome, run.fFacts, series);
    else if (form.fSchema == kFirstSchemaVersion)
        WriteFirstDocument(out, run.fReport, run.fOutcome);
    else
        WriteDocument(out, run.fReport, run.fOutcome, run.fFacts, series);
}

} // namespace

void WriteForm(std::ostream& out, const Form& form, const StoredRun& run)
{
    if (form.fFormat == Format::kHtml || form.fFormat == Format::kJson) {
        WriteExact(out, form, run);
        return;
    }
    const Report report = GetTypicalReport(run);
    switch (form.fFormat) {
    case Format::kPrometheus:
        WritePrometheusText(out, report, run.fOutcome, run.fFacts);
        break;
    case Format::kNodeFeatures:
        WriteNodeFeatures(out, report, run.fOutcome);
        break;
    case Format::kAnsible:
        WriteAnsibleFacts(out, report, run.fOutcome, run.fFacts);
        break;
    default:
        PrintText(out, report, run.fOutcome, form.fWidth);
        if (run.fSeries)
            PrintSeries(out, *run.fSeries, form.fWidth);
    }
}

} // namespace assay_host
