#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "report/TextTable.h"

namespace assay_host {
namespace {

using Texts = std::vector<std::string>;

TEST(TextTable, WrapsAtBlanksAndWithinLongWords)
{
    EXPECT_EQ(WrapText("", 10), Texts{""});
    EXPECT_EQ(WrapText("0123456789", 10), Texts{"0123456789"});
    EXPECT_EQ(WrapText("01234 6789 123", 10), (Texts{"01234 6789", "123"}));
    EXPECT_EQ(WrapText("01234 67890 23", 10), (Texts{"01234", "67890 23"}));
    EXPECT_EQ(WrapText("01234567890123456789012", 10), (Texts{"0123456789", "0123456789", "012"}));
    EXPECT_EQ(WrapText(" 123456789012", 10), (Texts{" 123456789", "012"}));
    EXPECT_EQ(WrapText("0123456789 ", 10), (Texts{"0123456789", ""}));
}

TEST(TextTable, CountsAndKeepsWholeCharacters)
{
    const std::string e = "\xC3\xA9";
    EXPECT_EQ(WrapText(e + e + e + e, 4), Texts{e + e + e + e});
    EXPECT_EQ(WrapText(e + e + e + e + e, 4), (Texts{e + e + e + e, e}));
    EXPECT_EQ(WrapText("\xFF\xFF\xFF", 2), (Texts{"\xFF\xFF", "\xFF"}));
}

TEST(TextTable, AlignsItsValues)
{
    TextTable table;
    table.Add("A", "first");
    table.Add("A heading that is very long", "");
    table.Add("Longer", "second value that is wrapped");
    table.Add("", "third");
    std::ostringstream out;
    table.Print(out, 31);
    EXPECT_EQ(out.str(), "  A       first\n"
                         "  A heading that is very long\n"
                         "  Longer  second value that is\n"
                         "          wrapped\n"
                         "          third\n");
}

TEST(TextTable, LeavesRoomForValuesBesideLongLabels)
{
    for (const std::size_t width : {0U, 5U, 10U, 11U, 29U}) {
        TextTable table;
        table.Add("A label", std::string(21, 'v'));
        std::ostringstream out;
        table.Print(out, width);
        EXPECT_EQ(out.str(), "  A label  " + std::string(20, 'v') + "\n           v\n") << width;
    }
}

} // namespace
} // namespace assay_host
