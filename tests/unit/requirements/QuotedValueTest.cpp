// The values of requirements in quotes.
#include "requirements/Requirement.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <variant>

namespace assay_host {
namespace {

std::string ReadValue(const std::string& value)
{
    try {
        return std::get<std::string>(ParseRequirement("GLName==" + value).fWanted);
    } catch (const std::runtime_error& failure) {
        const std::string text = failure.what();
        return "failure" + text.substr(text.rfind(": "));
    }
}

TEST(QuotedValue, EndsWithABareQuote)
{
    EXPECT_EQ(ReadValue(R"("")"), "");
    EXPECT_EQ(ReadValue(R"("x")"), "x");
    EXPECT_EQ(ReadValue(R"(  " x "  )"), " x ");
    EXPECT_EQ(ReadValue(R"("x\"y")"), "x\"y");
    EXPECT_EQ(ReadValue(R"("x\\")"), "x\\");
    EXPECT_EQ(ReadValue(R"("\x")"), "x");
    EXPECT_EQ(ReadValue(R"(x"y\)"), R"(x"y\)") << "not in quotes";
}

TEST(QuotedValue, NeedsItsClosingQuote)
{
    const std::string missing = "failure: the closing quote is missing";
    for (const char* value : {R"(")", R"("x)", R"("\")", R"("x\")", R"("x\)", R"("\)", R"("x\\\")"})
        EXPECT_EQ(ReadValue(value), missing) << value;
    const std::string more = "failure: text follows the closing quote";
    for (const char* value : {R"("x"y)", R"("""x")", R"("x" "y")", R"("x\\"")"})
        EXPECT_EQ(ReadValue(value), more) << value;
}

} // namespace
} // namespace assay_host
