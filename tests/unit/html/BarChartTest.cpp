#include <gtest/gtest.h>

#include <sstream>

#include "html/BarChart.h"

namespace assay_host {
namespace {

TEST(BarChart, BarsAreInProportion)
{
    std::ostringstream out;
    Markup page(out);
    AddBarChart(page, "Copy <bandwidth>", {{"a", 2e11, "200 GB/s"}, {"b&", 5e10, "50 GB/s"}});
    const std::string text = out.str();
    EXPECT_NE(text.find("<caption>Copy &lt;bandwidth&gt;</caption>"), std::string::npos);
    const std::size_t first = text.find("class=\"bar\" width=\"1000.0\"");
    const std::size_t second = text.find("class=\"bar\" width=\"250.0\"");
    ASSERT_NE(first, std::string::npos);
    ASSERT_NE(second, std::string::npos);
    EXPECT_LT(text.find(">a</th>"), first);
    EXPECT_LT(first, text.find("<td>200 GB/s</td>"));
    EXPECT_LT(text.find(">b&amp;</th>"), second);
    EXPECT_LT(second, text.find("<td>50 GB/s</td>"));
}

} // namespace
} // namespace assay_host
