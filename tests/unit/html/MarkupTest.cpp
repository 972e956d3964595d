#include <gtest/gtest.h>

#include <sstream>

#include "html/Markup.h"

namespace assay_host {
namespace {

TEST(Markup, EscapesWhatCouldEndAText)
{
    EXPECT_EQ(EscapeMarkup("a<b>&\"c'"), "a&lt;b&gt;&amp;&quot;c&#39;");
    EXPECT_EQ(EscapeMarkup("&amp;"), "&amp;amp;");
    EXPECT_EQ(EscapeMarkup(""), "");
    EXPECT_EQ(EscapeMarkup("\xC3\xA9"), "\xC3\xA9");
}

TEST(Markup, NestsElements)
{
    std::ostringstream out;
    Markup page(out);
    {
        const Element list(page, "ul", {{"class", "a\"b"}, {"hidden", ""}});
        page.Add("li", "1 < 2");
        const Element item(page, "li");
        page.AddText("<");
        page.Add("span", "x");
        page.AddRaw("<br>");
    }
    page.AddVoid("meta", {{"name", "<"}});
    EXPECT_EQ(out.str(), "<ul class=\"a&quot;b\" hidden=\"\"><li>1 &lt; 2</li>\n"
                         "<li>&lt;<span>x</span><br></li>\n"
                         "</ul>\n"
                         "<meta name=\"&lt;\">\n");
}

} // namespace
} // namespace assay_host
