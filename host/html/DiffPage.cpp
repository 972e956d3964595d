#include "html/DiffPage.h"

#include <algorithm>

#include <fmt/format.h>

#include "html/DiffTables.h"
#include "html/Markup.h"
#include "html/Page.h"
#include "report/Bytes.h"
#include "report/DiffJson.h"
#include "report/DiffSummary.h"

namespace assay_host {

namespace {

// Returns the file, how its run ended, and when and where it was, as far as it is known.
std::string DescribeRun(const std::string& file, const StoredRun& run)
{
    std::string text = ShowBytes(file);
    if (run.fExtent != OutcomeExtent::kNone)
        text += fmt::format(": {}", GetVerdictName(run.fOutcome.fVerdict));
    const Environment& environment = run.fFacts.fEnvironment;
    if (!environment.fTime.empty())
        text += ", " + ShowBytes(environment.fTime);
    for (const Fact* const fact : {&environment.fHost, &environment.fSystem})
        if (fact->IsKnown() && !fact->fValue.empty())
            text += ", " + ShowBytes(fact->fValue);
    return text;
}

class DiffPage {
public:
    DiffPage(Markup& page, const ComparedRuns& runs) : fPage(page), fRuns(runs) {}

    void Add()
    {
        AddHeader();
        const Element main(fPage, "main");
        if (const ComparedRun* const only = GetOnly()) {
            AddDiffTables(fPage, only->fComparison, "h2");
            return;
        }
        for (const ComparedRun& other : fRuns.GetOthers())
            AddOther(other);
    }

    std::string GetHeadline() const
    {
        if (const ComparedRun* const only = GetOnly())
            return GetDiffHeadline(only->fComparison);
        const auto& others = fRuns.GetOthers();
        const auto count =
            std::count_if(others.begin(), others.end(),
                          [](const ComparedRun& other) { return !other.fComparison.IsSame(); });
        return fmt::format("{} of {} reports differ{} from the first one.", count, others.size(),
                           count == 1 ? "s" : "");
    }

private:
    const ComparedRun* GetOnly() const
    {
        return fRuns.GetOthers().size() == 1 ? &fRuns.GetOthers().front() : nullptr;
    }

    void AddHeader()
    {
        const Element header(fPage, "header");
        fPage.Add("h1", GetHeadline());
        {
            const Element list(fPage, "dl");
            AddRow("First report", DescribeRun(fRuns.GetFile(), fRuns.GetRun()));
            if (const ComparedRun* const only = GetOnly())
                AddRow("Second report", DescribeRun(only->fFile, only->fRun));
        }
        if (const ComparedRun* const only = GetOnly())
            AddList(fPage, "h2", "What to do", GetDiffSteps(only->fComparison, only->fRun));
    }

    void AddRow(const char* label, const std::string& text)
    {
        fPage.Add("dt", label);
        fPage.Add("dd", text);
    }

    void AddOther(const ComparedRun& other)
    {
        fPage.Add("h2", ShowBytes(other.fFile));
        fPage.Add("p", DescribeRun(other.fFile, other.fRun), {{"class", "soft"}});
        fPage.Add("p", GetDiffHeadline(other.fComparison));
        AddList(fPage, "h3", "What to do", GetDiffSteps(other.fComparison, other.fRun));
        AddDiffTables(fPage, other.fComparison, "h3");
    }

    Markup& fPage;
    const ComparedRuns& fRuns;
};

} // namespace

void WriteDiffPage(std::ostream& out, const ComparedRuns& runs, const std::string& hostVersion)
{
    Markup page(out);
    DiffPage content(page, runs);
    WritePage(
        page, "assay: " + content.GetHeadline(), [&] { content.Add(); },
        [&](std::ostream& json) { WriteDiffDocument(json, runs, hostVersion); });
}

} // namespace assay_host
