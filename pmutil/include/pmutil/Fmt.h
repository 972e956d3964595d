// Turns typed values into text, with one default format per C type and the means to replace it:
// per call, or in a formatter's table. An unsigned number is taken for a bit pattern and shown in
// hexadecimal.
//
//     std::string text;
//     Fmt::ToText(text, 10u);         // 0x0000000a
//     Fmt::ToText(text, 10u, "%u");   // 10
//
// Formats are printf's, except that one for bool is a double string (kFormatYesNo) and one for char
// a function. A format that doesn't fit its type is the caller's fault, as with printf.
//
// Any thread may format; make and destroy formatters, and change tables, while no other one does.
#pragma once

#include <cstdint>
#include <string>

namespace pmutil {

// Formats for bool: the text for false, a zero byte, the text for true.
inline constexpr char kFormatfalsetrue[] = "false\0true";
inline constexpr char kFormatFalseTrue[] = "False\0True";
inline constexpr char kFormatNoYes[] = "No\0Yes";
inline constexpr char kFormatNOYES[] = "NO\0YES";
inline constexpr char kFormatnoyes[] = "no\0yes";

class Fmt {
public:
    // The types that have a format, in the order of the table.
    enum Kind {
        kBool,
        kChar,
        kSChar,
        kUChar,
        kShort,
        kUShort,
        kInt,
        kUInt,
        kLong,
        kULong,
        kLongLong,
        kULongLong,
        kFloat,
        kDouble,
        kCString,
        kPointer,
        kKinds
    };

    // The format of a char: writes `value` to `out`, quoted with `quote`.
    using CharFormat = void (*)(std::string& out, char value, char quote);

    // Starts out with the default formats, and joins the process's chain of formatters behind its
    // head.
    Fmt();
    virtual ~Fmt();
    Fmt(const Fmt&) = delete;
    Fmt& operator=(const Fmt&) = delete;

    // The head of the chain, whose table serves callers without a formatter: one static formatter.
    static Fmt& GetHead();

    // Replaces an entry of the table, for every kind but kChar. The text must outlive its use.
    void SetFormat(Kind kind, const char* format);
    void SetFormat(CharFormat format);

    // Replaces `out` by the text of a value; a null format stands for the table's. A null string
    // gives "<NULL>", whatever the format.
    void Format(std::string& out, bool value, const char* format = nullptr);
    void Format(std::string& out, char value, CharFormat format = nullptr);
    void Format(std::string& out, signed char value, const char* format = nullptr);
    void Format(std::string& out, unsigned char value, const char* format = nullptr);
    void Format(std::string& out, short value, const char* format = nullptr);
    void Format(std::string& out, unsigned short value, const char* format = nullptr);
    void Format(std::string& out, int value, const char* format = nullptr);
    void Format(std::string& out, unsigned int value, const char* format = nullptr);
    void Format(std::string& out, long value, const char* format = nullptr);
    void Format(std::string& out, unsigned long value, const char* format = nullptr);
    void Format(std::string& out, long long value, const char* format = nullptr);
    void Format(std::string& out, unsigned long long value, const char* format = nullptr);
    void Format(std::string& out, float value, const char* format = nullptr);
    void Format(std::string& out, double value, const char* format = nullptr);
    void Format(std::string& out, const char* value, const char* format = nullptr);
    void Format(std::string& out, const void* value, const char* format = nullptr);

    // The characters of a four-character code, highest byte first, between single quotes.
    void FormatCode(std::string& out, std::uint32_t value);

    // The same with the head of the chain.
    template <typename T>
    static void ToText(std::string& out, T value)
    {
        GetHead().Format(out, value);
    }
    template <typename T, typename F>
    static void ToText(std::string& out, T value, F format)
    {
        GetHead().Format(out, value, format);
    }
    static void CodeToText(std::string& out, std::uint32_t value);

    // The default formats. That of pointers is the one of unsigned long long, unless the platform
    // set another before.
    static const char* GetBoolFormat();
    static CharFormat GetCharFormat();
    static const char* GetSCharFormat();
    static const char* GetUCharFormat();
    static const char* GetShortFormat();
    static const char* GetUShortFormat();
    static const char* GetIntFormat();
    static const char* GetUIntFormat();
    static const char* GetLongFormat();
    static const char* GetULongFormat();
    static const char* GetLongLongFormat();
    static const char* GetULongLongFormat();
    static const char* GetFloatFormat();
    static const char* GetDoubleFormat();
    static const char* GetCStringFormat();
    static const char* GetPointerFormat();

    // Sets the default for pointers, for formatters made from now on; null goes back. A format of
    // the %p kind gets the pointer, any other one an unsigned long long.
    static void SetPlatformPointerFormat(const char* format);

    // A format text for decimal output in columns wide enough for every signed integer of `bytes`
    // bytes, 1 to 8: MakeDecimalFormat(4, "") gives "%11d".
    static std::string MakeDecimalFormat(int bytes, const char* lengthModifier);

protected:
    virtual void FormatPointer(std::string& out, const void* value, const char* format);
    virtual void FormatCString(std::string& out, const char* value, const char* format);
    virtual void FormatDouble(std::string& out, double value, const char* format);
    virtual void FormatFloat(std::string& out, float value, const char* format);
    virtual void FormatULongLong(std::string& out, unsigned long long value, const char* format);
    virtual void FormatLongLong(std::string& out, long long value, const char* format);
    virtual void FormatULong(std::string& out, unsigned long value, const char* format);
    virtual void FormatLong(std::string& out, long value, const char* format);
    virtual void FormatUInt(std::string& out, unsigned int value, const char* format);
    virtual void FormatInt(std::string& out, int value, const char* format);
    virtual void FormatUShort(std::string& out, unsigned short value, const char* format);
    virtual void FormatShort(std::string& out, short value, const char* format);
    virtual void FormatUChar(std::string& out, unsigned char value, const char* format);
    virtual void FormatSChar(std::string& out, signed char value, const char* format);
    virtual void FormatChar(std::string& out, char value, CharFormat format);
    virtual void FormatBool(std::string& out, bool value, const char* format);
    virtual void FormatFourCC(std::string& out, std::uint32_t value);

private:
    union Entry {
        const char* text;
        CharFormat function;
    };

    struct AsHead {};
    explicit Fmt(AsHead);
    explicit Fmt(Fmt& head);

    Fmt* fNext = nullptr;
    Fmt* fPrev = nullptr;
    Entry fFormats[kKinds];
};

} // namespace pmutil
