#include "html/BarChart.h"

#include <algorithm>

#include <fmt/format.h>

namespace assay_host {

namespace {

// The coordinates of a drawing, which the page stretches.
constexpr double kWidth = 1000;

void AddBar(Markup& page, double share)
{
    // The text beside it says the same.
    const Element drawing(
        page, "svg",
        {{"viewBox", "0 0 1000 10"}, {"preserveAspectRatio", "none"}, {"aria-hidden", "true"}});
    const std::string width = fmt::format("{:.1f}", share * kWidth);
    page.Add("rect", "", {{"class", "back"}, {"width", "1000"}, {"height", "10"}});
    page.Add("rect", "", {{"class", "bar"}, {"width", width}, {"height", "10"}});
}

} // namespace

void AddBarChart(Markup& page, const std::string& title, const std::vector<Bar>& bars)
{
    const double longest =
        std::max_element(bars.begin(), bars.end(), [](const Bar& left, const Bar& right) {
            return left.fValue < right.fValue;
        })->fValue;
    const Element table(page, "table", {{"class", "chart"}});
    page.Add("caption", title);
    const Element body(page, "tbody");
    for (const Bar& bar : bars) {
        const Element row(page, "tr");
        page.Add("th", bar.fLabel, {{"scope", "row"}});
        {
            const Element cell(page, "td");
            AddBar(page, bar.fValue / longest);
        }
        page.Add("td", bar.fText);
    }
}

} // namespace assay_host
