#include "pmutil/Fmt.h"

#include <charconv>
#include <cstdio>
#include <cstring>

#include "pmutil/Escape.h"
#include "pmutil/Format.h"

// Formats come from callers and from the table.
#pragma GCC diagnostic ignored "-Wformat-nonliteral"

namespace pmutil {

namespace {

constexpr char kDecimal[] = "%d";
constexpr char kDecimalLong[] = "%ld";
constexpr char kDecimalLongLong[] = "%lld";
constexpr char kFixedPoint[] = "%.2f";
constexpr char kQuoted[] = "\"%s\"";
constexpr char kCharQuote = 0x27;
constexpr char kStringQuote = 0x22;

const char* gPlatformPointerFormat = nullptr;

// printf to `out`. Texts below 256 bytes need no allocation besides `out`.
template <typename T>
void Print(std::string& out, const char* format, T value)
{
    char buffer[256];
    const int length = std::snprintf(buffer, sizeof buffer, format, value);
    if (length >= 0 && static_cast<std::size_t>(length) < sizeof buffer)
        out.assign(buffer, static_cast<std::size_t>(length));
    else
        out = FormatString(format, value);
}

// "%d", "%ld" and "%lld", the most used formats, without printf.
template <typename T>
void AssignDecimal(std::string& out, T value)
{
    char buffer[24];
    const auto end = std::to_chars(buffer, buffer + sizeof buffer, value).ptr;
    out.assign(buffer, static_cast<std::size_t>(end - buffer));
}

void WriteQuotedChar(std::string& out, char value, char quote)
{
    out += quote;
    EscapeCharacter(out, static_cast<unsigned char>(value), static_cast<unsigned char>(quote), 1);
    out += quote;
}

// Returns whether the character needs no escape between double quotes: printable ASCII, which is
// graphic in all locales, without the double quote and the backslash.
constexpr bool IsPlain(char character)
{
    return character >= ' ' && character <= '~' && character != kStringQuote && character != '\\';
}

// Appends `text`, escaped for double quotes. Copies runs of plain characters at once.
void AppendEscaped(std::string& out, const char* text)
{
    for (;;) {
        const char* const run = text;
        while (IsPlain(*text))
            ++text;
        out.append(run, static_cast<std::size_t>(text - run));
        if (*text == '\0')
            return;
        EscapeCharacter(out, static_cast<unsigned char>(*text++), kStringQuote, 1);
    }
}

// Returns the letter of a format's first conversion; 0 if it has none.
char GetConversion(const char* format)
{
    for (const char* at = std::strchr(format, '%'); at != nullptr; at = std::strchr(at + 1, '%')) {
        ++at;
        if (*at == '%')
            continue;
        return at[std::strspn(at, "0123456789.*+-# 'hlLqjzt")];
    }
    return '\0';
}

} // namespace

Fmt::Fmt() : Fmt(GetHead()) {}

Fmt::Fmt(AsHead)
{
    fFormats[kBool].text = GetBoolFormat();
    fFormats[kChar].function = GetCharFormat();
    fFormats[kSChar].text = GetSCharFormat();
    fFormats[kUChar].text = GetUCharFormat();
    fFormats[kShort].text = GetShortFormat();
    fFormats[kUShort].text = GetUShortFormat();
    fFormats[kInt].text = GetIntFormat();
    fFormats[kUInt].text = GetUIntFormat();
    fFormats[kLong].text = GetLongFormat();
    fFormats[kULong].text = GetULongFormat();
    fFormats[kLongLong].text = GetLongLongFormat();
    fFormats[kULongLong].text = GetULongLongFormat();
    fFormats[kFloat].text = GetFloatFormat();
    fFormats[kDouble].text = GetDoubleFormat();
    fFormats[kCString].text = GetCStringFormat();
    fFormats[kPointer].text = GetPointerFormat();
}

Fmt::Fmt(Fmt& head) : Fmt(AsHead())
{
    fPrev = &head;
    fNext = head.fNext;
    head.fNext = this;
    if (fNext != nullptr)
        fNext->fPrev = this;
}

Fmt::~Fmt()
{
    if (fNext != nullptr)
        fNext->fPrev = fPrev;
    if (fPrev != nullptr)
        fPrev->fNext = fNext;
}

Fmt& Fmt::GetHead()
{
    // Never destroyed: it must outlive all formatters.
    static Fmt& head = *new Fmt(AsHead());
    return head;
}

void Fmt::SetFormat(Kind kind, const char* format)
{
    if (kind != kChar)
        fFormats[kind].text = format;
}

void Fmt::SetFormat(CharFormat format)
{
    fFormats[kChar].function = format;
}

void Fmt::Format(std::string& out, bool value, const char* format)
{
    out.clear();
    FormatBool(out, value, format != nullptr ? format : fFormats[kBool].text);
}

void Fmt::Format(std::string& out, char value, CharFormat format)
{
    out.clear();
    FormatChar(out, value, format != nullptr ? format : fFormats[kChar].function);
}

void Fmt::Format(std::string& out, signed char value, const char* format)
{
    out.clear();
    FormatSChar(out, value, format != nullptr ? format : fFormats[kSChar].text);
}

void Fmt::Format(std::string& out, unsigned char value, const char* format)
{
    out.clear();
    FormatUChar(out, value, format != nullptr ? format : fFormats[kUChar].text);
}

void Fmt::Format(std::string& out, short value, const char* format)
{
    out.clear();
    FormatShort(out, value, format != nullptr ? format : fFormats[kShort].text);
}

void Fmt::Format(std::string& out, unsigned short value, const char* format)
{
    out.clear();
    FormatUShort(out, value, format != nullptr ? format : fFormats[kUShort].text);
}

void Fmt::Format(std::string& out, int value, const char* format)
{
    out.clear();
    FormatInt(out, value, format != nullptr ? format : fFormats[kInt].text);
}

void Fmt::Format(std::string& out, unsigned int value, const char* format)
{
    out.clear();
    FormatUInt(out, value, format != nullptr ? format : fFormats[kUInt].text);
}

void Fmt::Format(std::string& out, long value, const char* format)
{
    out.clear();
    FormatLong(out, value, format != nullptr ? format : fFormats[kLong].text);
}

void Fmt::Format(std::string& out, unsigned long value, const char* format)
{
    out.clear();
    FormatULong(out, value, format != nullptr ? format : fFormats[kULong].text);
}

void Fmt::Format(std::string& out, long long value, const char* format)
{
    out.clear();
    FormatLongLong(out, value, format != nullptr ? format : fFormats[kLongLong].text);
}

void Fmt::Format(std::string& out, unsigned long long value, const char* format)
{
    out.clear();
    FormatULongLong(out, value, format != nullptr ? format : fFormats[kULongLong].text);
}

void Fmt::Format(std::string& out, float value, const char* format)
{
    out.clear();
    FormatFloat(out, value, format != nullptr ? format : fFormats[kFloat].text);
}

void Fmt::Format(std::string& out, double value, const char* format)
{
    out.clear();
    FormatDouble(out, value, format != nullptr ? format : fFormats[kDouble].text);
}

void Fmt::Format(std::string& out, const char* value, const char* format)
{
    out.clear();
    FormatCString(out, value, format != nullptr ? format : fFormats[kCString].text);
}

void Fmt::Format(std::string& out, const void* value, const char* format)
{
    out.clear();
    FormatPointer(out, value, format != nullptr ? format : fFormats[kPointer].text);
}

void Fmt::FormatCode(std::string& out, std::uint32_t value)
{
    out.clear();
    FormatFourCC(out, value);
}

void Fmt::CodeToText(std::string& out, std::uint32_t value)
{
    GetHead().FormatCode(out, value);
}

const char* Fmt::GetBoolFormat()
{
    return kFormatfalsetrue;
}

Fmt::CharFormat Fmt::GetCharFormat()
{
    return WriteQuotedChar;
}

const char* Fmt::GetSCharFormat()
{
    return kDecimal;
}

const char* Fmt::GetUCharFormat()
{
    return "0x%02x";
}

const char* Fmt::GetShortFormat()
{
    return kDecimal;
}

const char* Fmt::GetUShortFormat()
{
    return "0x%04x";
}

const char* Fmt::GetIntFormat()
{
    return kDecimal;
}

const char* Fmt::GetUIntFormat()
{
    static const std::string format = MakeHexFormat(4, "");
    return format.c_str();
}

const char* Fmt::GetLongFormat()
{
    return kDecimalLong;
}

const char* Fmt::GetULongFormat()
{
    // At least 8 digits on all platforms, also if the type has 8 bytes.
    static const std::string format = MakeHexFormat(4, "l");
    return format.c_str();
}

const char* Fmt::GetLongLongFormat()
{
    return kDecimalLongLong;
}

const char* Fmt::GetULongLongFormat()
{
    static const std::string format = MakeHexFormat(8, "ll");
    return format.c_str();
}

const char* Fmt::GetFloatFormat()
{
    return kFixedPoint;
}

const char* Fmt::GetDoubleFormat()
{
    return kFixedPoint;
}

const char* Fmt::GetCStringFormat()
{
    return kQuoted;
}

const char* Fmt::GetPointerFormat()
{
    return gPlatformPointerFormat != nullptr ? gPlatformPointerFormat : GetULongLongFormat();
}

void Fmt::SetPlatformPointerFormat(const char* format)
{
    gPlatformPointerFormat = format;
}

std::string Fmt::MakeDecimalFormat(int bytes, const char* lengthModifier)
{
    const auto max = static_cast<long long>((1ULL << (8 * bytes - 1)) - 1);
    const std::size_t width = FormatString("%lld", max).size() + 1;
    return FormatString("%%%d%sd", static_cast<int>(width), lengthModifier);
}

void Fmt::FormatPointer(std::string& out, const void* value, const char* format)
{
    if (GetConversion(format) == 'p')
        Print(out, format, value);
    else
        Fmt::FormatULongLong(out, reinterpret_cast<std::uintptr_t>(value), format);
}

void Fmt::FormatCString(std::string& out, const char* value, const char* format)
{
    if (value == nullptr) {
        out = "<NULL>";
        return;
    }
    if (format == kQuoted) {
        out = kStringQuote;
        AppendEscaped(out, value);
        out += kStringQuote;
    } else {
        std::string escaped;
        AppendEscaped(escaped, value);
        Print(out, format, escaped.c_str());
    }
}

void Fmt::FormatDouble(std::string& out, double value, const char* format)
{
    Print(out, format, value);
}

void Fmt::FormatFloat(std::string& out, float value, const char* format)
{
    Print(out, format, static_cast<double>(value));
}

void Fmt::FormatULongLong(std::string& out, unsigned long long value, const char* format)
{
    Print(out, format, value);
}

void Fmt::FormatLongLong(std::string& out, long long value, const char* format)
{
    if (format == kDecimalLongLong)
        AssignDecimal(out, value);
    else
        Print(out, format, value);
}

void Fmt::FormatULong(std::string& out, unsigned long value, const char* format)
{
    Print(out, format, value);
}

void Fmt::FormatLong(std::string& out, long value, const char* format)
{
    if (format == kDecimalLong)
        AssignDecimal(out, value);
    else
        Print(out, format, value);
}

void Fmt::FormatUInt(std::string& out, unsigned int value, const char* format)
{
    Print(out, format, value);
}

void Fmt::FormatInt(std::string& out, int value, const char* format)
{
    if (format == kDecimal)
        AssignDecimal(out, value);
    else
        Print(out, format, value);
}

void Fmt::FormatUShort(std::string& out, unsigned short value, const char* format)
{
    Print(out, format, static_cast<unsigned int>(value));
}

void Fmt::FormatShort(std::string& out, short value, const char* format)
{
    if (format == kDecimal)
        AssignDecimal(out, value);
    else
        Print(out, format, static_cast<int>(value));
}

void Fmt::FormatUChar(std::string& out, unsigned char value, const char* format)
{
    Print(out, format, static_cast<unsigned int>(value));
}

void Fmt::FormatSChar(std::string& out, signed char value, const char* format)
{
    if (format == kDecimal)
        AssignDecimal(out, static_cast<int>(value));
    else
        Print(out, format, static_cast<int>(value));
}

void Fmt::FormatChar(std::string& out, char value, CharFormat format)
{
    format(out, value, kCharQuote);
}

void Fmt::FormatBool(std::string& out, bool value, const char* format)
{
    out = value ? format + std::strlen(format) + 1 : format;
}

void Fmt::FormatFourCC(std::string& out, std::uint32_t value)
{
    out = kCharQuote;
    for (int shift = 24; shift >= 0; shift -= 8) {
        const std::uint32_t code = (value >> shift) & 0xFF;
        if (code == 0)
            break;
        // Escaped for double quotes although the quotes around are single. Keep that format.
        EscapeCharacter(out, code, kStringQuote, 1);
    }
    out += kCharQuote;
}

} // namespace pmutil
