#include "app/Forms.h"

#include "fleet/AnsibleFacts.h"
#include "fleet/NodeFeatures.h"
#include "fleet/PrometheusText.h"
#include "html/ReportPage.h"
#include "report/JsonDocument.h"
#include "report/TextView.h"

namespace assay_host {

void WriteForm(std::ostream& out, const Form& form, const Report& report, const RunOutcome& outcome,
               const RunFacts& facts)
{
    switch (form.fFormat) {
    case Format::kText:
    case Format::kJsonLines:
        PrintText(out, report, outcome, form.fWidth);
        break;
    case Format::kJson:
        if (form.fSchema == kFirstSchemaVersion)
            WriteFirstDocument(out, report, outcome);
        else
            WriteDocument(out, report, outcome, facts);
        break;
    case Format::kHtml:
        WriteReportPage(out, report, outcome, facts);
        break;
    case Format::kPrometheus:
        WritePrometheusText(out, report, outcome, facts);
        break;
    case Format::kNodeFeatures:
        WriteNodeFeatures(out, report, outcome);
        break;
    case Format::kAnsible:
        WriteAnsibleFacts(out, report, outcome, facts);
        break;
    }
}

} // namespace assay_host
