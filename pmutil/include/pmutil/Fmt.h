// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Formats typed values. Each C type has a default format, which can be replaced per call or in a
// formatter's table. Unsigned numbers are formatted in hexadecimal.
//
//     std::string text;
//     Fmt::ToText(text, 10u);         // 0x0000000a
//     Fmt::ToText(text, 10u, "%u");   // 10
//
// Formats are those of printf, except for bool (two zero-terminated texts, such as kFormatNoYes)
// and char (a function). A format that doesn't match its type is undefined behaviour, as with
// printf.
//
// Any thread may format. Don't make, destroy or change formatters while another thread uses any.
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

    // The format of a char: appends `value` to `out`, quoted with `quote`.
    using CharFormat = void (*)(std::string& out, char value, char quote);

    // Sets the default formats and inserts the formatter after the head of the process's list of
    // formatters.
    Fmt();
    virtual ~Fmt();
    Fmt(const Fmt&) = delete;
    Fmt& operator=(const Fmt&) = delete;

    // Returns the head of the list, a static formatter. ToText and CodeToText use its table.
    static Fmt& GetHead();

    // Replaces an entry of the table. `format` must outlive the formatter. Does nothing for kChar;
    // use the second form.
    void SetFormat(Kind kind, const char* format);
    void SetFormat(CharFormat format);

    // Sets `out` to the text of a value. If `format` is null, the table's format is used. A null
    // string is "<NULL>" in any format.
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

    // Sets `out` to the characters of a four-character code, highest byte first, in single quotes.
    void FormatCode(std::string& out, std::uint32_t value);

    // The same with the head of the list.
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

    // The default formats. For pointers it is that of unsigned long long, unless
    // SetPlatformPointerFormat has set another.
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

    // Sets the default format of pointers for formatters made later; null restores the initial one.
    // A %p format gets the pointer, any other format an unsigned long long.
    static void SetPlatformPointerFormat(const char* format);

    // Returns a decimal format whose width fits every signed integer of `bytes` bytes, 1 to 8:
    // MakeDecimalFormat(4, "") returns "%11d".
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
