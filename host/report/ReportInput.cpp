#include "report/ReportInput.h"

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <stdexcept>
#include <string_view>
#include <system_error>

#include <fmt/format.h>

namespace assay_host {

namespace {

constexpr std::size_t kBlockBytes = std::size_t{1} << 16;

std::runtime_error SystemFailure(const char* what)
{
    const int code = errno;
    return std::runtime_error(fmt::format("{}: {}", what, std::generic_category().message(code)));
}

} // namespace

ReportInput::ReportInput(const std::string& path) : ReportInput(path, Limits()) {}

ReportInput::ReportInput(const std::string& path, const Limits& limits)
    : fLimits(limits), fFile(std::filesystem::u8path(path), std::ios::binary)
{
    if (!fFile)
        throw SystemFailure("can't open");
}

std::string ReportInput::PeekJsonLine(std::size_t maxBytes)
{
    constexpr std::string_view kBlanks = " \t\r\n";
    std::size_t first = 0; // of the line: after the blanks
    std::size_t end = 0;   // of the line, as far as it was searched
    while (fBlock.size() < maxBytes && ReadBlock()) {
        const std::string_view text(fBlock.data(), fBlock.size());
        first = std::min(text.find_first_not_of(kBlanks, first), text.size());
        if (first == text.size())
            continue;
        if (text[first] != '{')
            break;
        end = text.find('\n', std::max(first, end));
        if (end != std::string_view::npos)
            break;
        end = text.size();
    }
    setg(fBlock.data(), fBlock.data(), fBlock.data() + fBlock.size());
    return end > first ? std::string(fBlock.data() + first, end - first) : std::string();
}

void ReportInput::ExpectJson()
{
    fIsJson = true;
    CheckWords();
}

ReportInput::int_type ReportInput::underflow()
{
    fBlock.clear();
    ReadBlock();
    if (fIsJson)
        CheckWords();
    setg(fBlock.data(), fBlock.data(), fBlock.data() + fBlock.size());
    return fBlock.empty() ? traits_type::eof() : traits_type::to_int_type(fBlock.front());
}

bool ReportInput::ReadBlock()
{
    const std::size_t before = fBlock.size();
    fBlock.resize(before + kBlockBytes);
    fFile.read(fBlock.data() + before, static_cast<std::streamsize>(kBlockBytes));
    const auto count = static_cast<std::size_t>(fFile.gcount());
    fBlock.resize(before + count);
    if (fFile.bad())
        throw SystemFailure("can't read");
    fBytes += count;
    if (fBytes > fLimits.fMaxBytes)
        throw std::runtime_error("too large for a report");
    return count > 0;
}

void ReportInput::CheckWords()
{
    for (const char byte : fBlock) {
        const bool isQuote = byte == '"' && !fIsEscaped;
        const bool isBetween =
            !fIsInString && std::string_view("{}[],: \t\r\n").find(byte) != std::string_view::npos;
        fIsEscaped = fIsInString && !fIsEscaped && byte == '\\';
        if (isQuote)
            fIsInString = !fIsInString;
        fWordBytes = isQuote || isBetween ? 0 : fWordBytes + 1;
        if (fWordBytes > fLimits.fMaxWordBytes)
            throw std::runtime_error("too large for a report");
    }
}

} // namespace assay_host
