// Every kind of value has its own entry in the table, and its own virtual operation.
#include <gtest/gtest.h>

#include "pmutil/Fmt.h"

using pmutil::Fmt;

namespace {

template <typename T>
std::string Text(Fmt& fmt, T value)
{
    std::string text = "earlier";
    fmt.Format(text, value);
    return text;
}

// The texts of one value of each kind except char, in the order of the table.
std::vector<std::string> AllTexts(Fmt& fmt)
{
    const int target = 0;
    return {Text(fmt, true),
            Text(fmt, static_cast<signed char>(1)),
            Text(fmt, static_cast<unsigned char>(1)),
            Text(fmt, static_cast<short>(1)),
            Text(fmt, static_cast<unsigned short>(1)),
            Text(fmt, 1),
            Text(fmt, 1U),
            Text(fmt, 1L),
            Text(fmt, 1UL),
            Text(fmt, 1LL),
            Text(fmt, 1ULL),
            Text(fmt, 1.0F),
            Text(fmt, 1.0),
            Text(fmt, "text"),
            Text(fmt, static_cast<const void*>(&target))};
}

TEST(FmtTable, AnEntryServesItsOwnKindAlone)
{
    constexpr Fmt::Kind kKinds[] = {Fmt::kBool,   Fmt::kSChar,    Fmt::kUChar,     Fmt::kShort,
                                    Fmt::kUShort, Fmt::kInt,      Fmt::kUInt,      Fmt::kLong,
                                    Fmt::kULong,  Fmt::kLongLong, Fmt::kULongLong, Fmt::kFloat,
                                    Fmt::kDouble, Fmt::kCString,  Fmt::kPointer};
    Fmt untouched;
    const auto defaults = AllTexts(untouched);
    for (std::size_t changed = 0; changed < std::size(kKinds); ++changed) {
        Fmt fmt;
        fmt.SetFormat(kKinds[changed], "own\0own"); // valid for bool too
        const auto texts = AllTexts(fmt);
        for (std::size_t kind = 0; kind < std::size(kKinds); ++kind)
            EXPECT_EQ(texts[kind], kind == changed ? "own" : defaults[kind])
                << kind << " with the entry of " << changed;
    }
}

// Appends which of its operations was called: nothing of an earlier text may be left by then.
class Telling : public Fmt {
protected:
    void FormatPointer(std::string& out, const void*, const char*) override { out += "Pointer"; }
    void FormatCString(std::string& out, const char*, const char*) override { out += "CString"; }
    void FormatDouble(std::string& out, double, const char*) override { out += "Double"; }
    void FormatFloat(std::string& out, float, const char*) override { out += "Float"; }
    void FormatULongLong(std::string& out, unsigned long long, const char*) override
    {
        out += "ULongLong";
    }
    void FormatLongLong(std::string& out, long long, const char*) override { out += "LongLong"; }
    void FormatULong(std::string& out, unsigned long, const char*) override { out += "ULong"; }
    void FormatLong(std::string& out, long, const char*) override { out += "Long"; }
    void FormatUInt(std::string& out, unsigned int, const char*) override { out += "UInt"; }
    void FormatInt(std::string& out, int, const char*) override { out += "Int"; }
    void FormatUShort(std::string& out, unsigned short, const char*) override { out += "UShort"; }
    void FormatShort(std::string& out, short, const char*) override { out += "Short"; }
    void FormatUChar(std::string& out, unsigned char, const char*) override { out += "UChar"; }
    void FormatSChar(std::string& out, signed char, const char*) override { out += "SChar"; }
    void FormatChar(std::string& out, char, CharFormat) override { out += "Char"; }
    void FormatBool(std::string& out, bool, const char*) override { out += "Bool"; }
    void FormatFourCC(std::string& out, std::uint32_t) override { out += "FourCC"; }
};

TEST(FmtOverride, IsCalledForItsOwnKindAlone)
{
    Telling fmt;
    EXPECT_EQ(AllTexts(fmt),
              (std::vector<std::string>{"Bool", "SChar", "UChar", "Short", "UShort", "Int", "UInt",
                                        "Long", "ULong", "LongLong", "ULongLong", "Float", "Double",
                                        "CString", "Pointer"}));
    EXPECT_EQ(Text(fmt, 'a'), "Char");
    std::string code = "earlier";
    fmt.FormatCode(code, 0x61626364);
    EXPECT_EQ(code, "FourCC");
}

} // namespace
