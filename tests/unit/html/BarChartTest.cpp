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
    EXPECT_EQ(text.substr(0, text.find("</td>")),
              "<table class=\"chart\"><caption>Copy &lt;bandwidth&gt;</caption>\n<tbody><tr>"
              "<th scope=\"row\">a</th>\n<td><svg viewBox=\"0 0 1000 10\" "
              "preserveAspectRatio=\"none\" aria-hidden=\"true\">"
              "<rect class=\"back\" width=\"1000\" height=\"10\"></rect>\n"
              "<rect class=\"bar\" width=\"1000.0\" height=\"10\"></rect>\n</svg>\n");
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
