#include <gtest/gtest.h>

#include <cstddef>
#include <optional>
#include <sstream>
#include <string>
#include <vector>

#include "html/BoxPlot.h"

namespace assay_host {
namespace {

std::string Draw(const std::vector<double>& samples, std::optional<double> first = std::nullopt)
{
    std::ostringstream out;
    Markup page(out);
    BoxPlot plot;
    plot.fId = "p";
    plot.fTitle = "A <title>";
    plot.fText = "A text & more";
    plot.fMinText = "1 s";
    plot.fMaxText = "<6 s>";
    plot.fSamples = samples;
    plot.fFirst = first;
    AddBoxPlot(page, plot);
    return out.str();
}

std::size_t Count(const std::string& page, const std::string& part)
{
    std::size_t count = 0;
    for (std::size_t at = page.find(part); at != std::string::npos; at = page.find(part, at + 1))
        ++count;
    return count;
}

bool Has(const std::string& page, const std::string& part)
{
    return Count(page, part) > 0;
}

const std::string kHead = "<svg class=\"plot\" viewBox=\"0 0 600 48\" role=\"img\" "
                          "aria-labelledby=\"p p-text\"><title id=\"p\">A &lt;title&gt;</title>\n"
                          "<desc id=\"p-text\">A text &amp; more</desc>\n";
const std::string kEnd = "</svg>\n<div class=\"scale\"><span>1 s</span><span>&lt;6 s&gt;</span>"
                         "</div>\n";

TEST(BoxPlot, HasABoxALineForEachQuartileAndADotForEachRun)
{
    EXPECT_EQ(
        Draw({2, 1, 3, 5, 4}, 6),
        kHead +
            "<line class=\"whisker\" x1=\"8.0\" y1=\"16.0\" x2=\"475.2\" y2=\"16.0\"></line>\n"
            "<line class=\"whisker\" x1=\"8.0\" y1=\"4.0\" x2=\"8.0\" y2=\"28.0\"></line>\n"
            "<line class=\"whisker\" x1=\"475.2\" y1=\"4.0\" x2=\"475.2\" y2=\"28.0\">"
            "</line>\n"
            "<rect class=\"box\" x=\"124.8\" y=\"4.0\" width=\"233.6\" height=\"24.0\">"
            "</rect>\n"
            "<line class=\"median\" x1=\"241.6\" y1=\"4.0\" x2=\"241.6\" y2=\"28.0\"></line>\n"
            "<circle class=\"dot\" cx=\"124.8\" cy=\"40.0\" r=\"4.0\"></circle>\n"
            "<circle class=\"dot\" cx=\"8.0\" cy=\"40.0\" r=\"4.0\"></circle>\n"
            "<circle class=\"dot\" cx=\"241.6\" cy=\"40.0\" r=\"4.0\"></circle>\n"
            "<circle class=\"dot\" cx=\"475.2\" cy=\"40.0\" r=\"4.0\"></circle>\n"
            "<circle class=\"dot\" cx=\"358.4\" cy=\"40.0\" r=\"4.0\"></circle>\n"
            "<path class=\"first\" d=\"M586.0 40.0L592.0 34.0L598.0 40.0L592.0 46.0Z\">"
            "</path>\n" +
            kEnd);
}

TEST(BoxPlot, OfOneValueIsInTheMiddle)
{
    const std::string page = Draw({2, 2});
    EXPECT_EQ(Count(page, "cx=\"300.0\""), 2U);
    EXPECT_TRUE(Has(page, "<rect class=\"box\" x=\"300.0\" y=\"4.0\" width=\"0.0\""));
    EXPECT_FALSE(Has(page, "class=\"first\""));
    EXPECT_TRUE(Has(Draw({2}, 2), "M294.0 40.0L300.0 34.0"));
}

TEST(BoxPlot, GoesFromTheSmallestToTheLargestOfAllRuns)
{
    const std::string page = Draw({2, 3}, 1);
    EXPECT_TRUE(Has(page, "d=\"M2.0 40.0L8.0 34.0L14.0 40.0L8.0 46.0Z\""));
    EXPECT_TRUE(Has(page, "cx=\"300.0\""));
    EXPECT_TRUE(Has(page, "cx=\"592.0\""));
    EXPECT_TRUE(Has(Draw({1, 3}, 2), "d=\"M294.0 40.0"));
}

TEST(BoxPlot, ItsLinesEndBeforeOutliers)
{
    const std::string page = Draw({-100, 1, 2, 3, 4, 5, 100});
    EXPECT_EQ(Count(page, "<circle class=\"outlier\""), 2U);
    EXPECT_EQ(Count(page, "<circle class=\"dot\""), 5U);
    EXPECT_TRUE(Has(page, "<circle class=\"outlier\" cx=\"8.0\""));
    EXPECT_TRUE(Has(page, "<circle class=\"outlier\" cx=\"592.0\""));
    // 1 and 5 on a scale from -100 to 100.
    EXPECT_TRUE(Has(page, "<line class=\"whisker\" x1=\"302.9\" y1=\"16.0\" x2=\"314.6\""));
}

TEST(BoxPlot, HasAtMost200Dots)
{
    EXPECT_EQ(Count(Draw(std::vector<double>(200, 1)), "<circle"), 200U);
    EXPECT_EQ(Count(Draw(std::vector<double>(201, 1)), "<circle"), 0U);
    std::vector<double> samples(900, 1);
    samples.resize(1100, 2);
    const std::string all = Draw(samples);
    EXPECT_EQ(Count(all, "<circle class=\"outlier\""), 200U);
    EXPECT_EQ(Count(all, "<circle class=\"dot\""), 0U);
    samples.push_back(2);
    EXPECT_EQ(Count(Draw(samples), "<circle"), 200U);
}

} // namespace
} // namespace assay_host
