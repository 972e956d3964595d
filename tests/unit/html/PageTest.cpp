#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "html/Assets.h"
#include "html/Markup.h"
#include "html/Page.h"

namespace assay_host {
namespace {

TEST(Page, HasItsStyleItsContentAndADocument)
{
    std::ostringstream out;
    Markup page(out);
    WritePage(
        page, "A <title>", [&] { page.Add("main", "content"); },
        [](std::ostream& json) {
            json.put('{');
            json.put('<');
            json << "a<<b" << '<';
            json.put('}');
        });
    const std::string text = out.str();
    EXPECT_NE(text.find("<title>A &lt;title&gt;</title>\n<style>" + std::string(kPageStyle) +
                        "</style>\n</head>\n<body><main>content</main>\n<footer>"),
              std::string::npos)
        << text.substr(0, 600);
    EXPECT_NE(text.find("id=\"json\">{\\u003Ca\\u003C\\u003Cb\\u003C}</script>\n<script>" +
                        std::string(kCopyScript) + "</script>\n</body>\n</html>\n"),
              std::string::npos);
}

TEST(Page, AListHasAHeading)
{
    std::ostringstream out;
    Markup page(out);
    AddList(page, "h3", "Steps", {});
    EXPECT_EQ(out.str(), "");
    AddList(page, "h3", "Steps", {"one", "<two>"});
    EXPECT_EQ(out.str(), "<h3>Steps</h3>\n<ul><li>one</li>\n<li>&lt;two&gt;</li>\n</ul>\n");
}

} // namespace
} // namespace assay_host
