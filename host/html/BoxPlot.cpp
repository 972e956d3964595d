#include "html/BoxPlot.h"

#include <algorithm>

#include <fmt/format.h>

#include "statistics/Summary.h"

namespace assay_host {

namespace {

// The drawing's coordinates.
constexpr double kLeft = 8;
constexpr double kWidth = 584;
constexpr double kBoxTop = 4;
constexpr double kBoxHeight = 24;
constexpr double kStrip = 40; // the middle of the dots
constexpr double kDot = 4;    // the radius of a dot

constexpr std::size_t kMaxDots = 200;

std::string Show(double coordinate)
{
    return fmt::format("{:.1f}", coordinate);
}

class Drawing {
public:
    Drawing(Markup& page, const BoxPlot& plot)
        : fPage(page), fPlot(plot), fSummary(Summarize(plot.fSamples))
    {
        fMin = std::min(fSummary.fMinimum, plot.fFirst.value_or(fSummary.fMinimum));
        fMax = std::max(fSummary.fMaximum, plot.fFirst.value_or(fSummary.fMaximum));
    }

    void Add()
    {
        AddBox();
        AddDots();
        AddFirst();
    }

private:
    double GetX(double value) const
    {
        return kLeft + (fMax > fMin ? (value - fMin) / (fMax - fMin) * kWidth : kWidth / 2);
    }

    void AddLine(const char* name, double fromX, double fromY, double toX, double toY)
    {
        fPage.Add("line", "",
                  {{"class", name},
                   {"x1", Show(fromX)},
                   {"y1", Show(fromY)},
                   {"x2", Show(toX)},
                   {"y2", Show(toY)}});
    }

    void AddBox()
    {
        double low = fSummary.fMaximum;
        double high = fSummary.fMinimum;
        for (const double sample : fPlot.fSamples) {
            if (!fSummary.IsOutlier(sample)) {
                low = std::min(low, sample);
                high = std::max(high, sample);
            }
        }
        const double middle = kBoxTop + kBoxHeight / 2;
        const double bottom = kBoxTop + kBoxHeight;
        AddLine("whisker", GetX(low), middle, GetX(high), middle);
        AddLine("whisker", GetX(low), kBoxTop, GetX(low), bottom);
        AddLine("whisker", GetX(high), kBoxTop, GetX(high), bottom);
        const double left = GetX(fSummary.fLowerQuartile);
        fPage.Add("rect", "",
                  {{"class", "box"},
                   {"x", Show(left)},
                   {"y", Show(kBoxTop)},
                   {"width", Show(GetX(fSummary.fUpperQuartile) - left)},
                   {"height", Show(kBoxHeight)}});
        AddLine("median", GetX(fSummary.fMedian), kBoxTop, GetX(fSummary.fMedian), bottom);
    }

    void AddDots()
    {
        const bool hasAll = fPlot.fSamples.size() <= kMaxDots;
        std::size_t dots = 0;
        for (const double sample : fPlot.fSamples) {
            const bool isOutlier = fSummary.IsOutlier(sample);
            if ((!isOutlier && !hasAll) || dots == kMaxDots)
                continue;
            ++dots;
            fPage.Add("circle", "",
                      {{"class", isOutlier ? "outlier" : "dot"},
                       {"cx", Show(GetX(sample))},
                       {"cy", Show(kStrip)},
                       {"r", Show(kDot)}});
        }
    }

    void AddFirst()
    {
        if (!fPlot.fFirst)
            return;
        const double x = GetX(*fPlot.fFirst);
        const double size = 1.5 * kDot;
        fPage.Add("path", "",
                  {{"class", "first"},
                   {"d", fmt::format("M{:.1f} {:.1f}L{:.1f} {:.1f}L{:.1f} {:.1f}L{:.1f} {:.1f}Z",
                                     x - size, kStrip, x, kStrip - size, x + size, kStrip, x,
                                     kStrip + size)}});
    }

    Markup& fPage;
    const BoxPlot& fPlot;
    const Summary fSummary;
    double fMin = 0;
    double fMax = 0;
};

} // namespace

void AddBoxPlot(Markup& page, const BoxPlot& plot)
{
    const std::string description = plot.fId + "-text";
    {
        const Element drawing(page, "svg",
                              {{"class", "plot"},
                               {"viewBox", "0 0 600 48"},
                               {"role", "img"},
                               {"aria-labelledby", plot.fId + " " + description}});
        page.Add("title", plot.fTitle, {{"id", plot.fId}});
        page.Add("desc", plot.fText, {{"id", description}});
        Drawing(page, plot).Add();
    }
    const Element scale(page, "div", {{"class", "scale"}});
    page.Add("span", plot.fMinText);
    page.Add("span", plot.fMaxText);
}

} // namespace assay_host
