#include "report/ReportFile.h"

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "report/JsonDocument.h"
#include "report/ReportReader.h"

namespace assay_host {

namespace {

// The largest document of a report that keeps to the reader's limits is smaller.
constexpr std::size_t kMostBytes = std::size_t{512} << 20;

std::runtime_error SystemFailure(const char* what)
{
    const int code = errno;
    return std::runtime_error(fmt::format("{}: {}", what, std::generic_category().message(code)));
}

std::string ReadFile(const std::string& path)
{
    std::ifstream file(std::filesystem::u8path(path), std::ios::binary);
    if (!file)
        throw SystemFailure("can't open");
    std::string text;
    std::string piece(std::size_t{1} << 20, '\0');
    while (file) {
        file.read(piece.data(), static_cast<std::streamsize>(piece.size()));
        text.append(piece, 0, static_cast<std::size_t>(file.gcount()));
        if (text.size() > kMostBytes)
            throw std::runtime_error("too large for a report");
    }
    if (file.bad())
        throw SystemFailure("can't read");
    return text;
}

// One value in the whole text is a document; a value behind another is the events' form.
Report ReadJson(const std::string& text)
{
    using Json = nlohmann::ordered_json;
    const std::size_t end = text.find('\n');
    const Json first = Json::parse(
        text.begin(),
        end == std::string::npos ? text.end() : text.begin() + static_cast<std::ptrdiff_t>(end),
        nullptr, false);
    if (first.is_object() && first.contains("event"))
        return ReadEvents(text);
    try {
        return ReadDocument(Json::parse(text));
    } catch (const Json::exception& failure) {
        throw std::runtime_error(std::string("not valid JSON: ") + failure.what());
    }
}

Report ReadText(std::string_view text)
{
    ReportReader reader;
    Report report;
    report.Add(reader.Feed(text));
    report.Add(reader.Finish());
    if (reader.GetLostByteCount() > 0)
        throw std::runtime_error("lines too long, or too many, for a report");
    const std::vector<ReportLine>& lines = report.GetLines();
    if (std::none_of(lines.begin(), lines.end(),
                     [](const ReportLine& line) { return line.fKind == LineKind::kValue; }))
        throw std::runtime_error("neither a JSON document nor a report");
    return report;
}

} // namespace

Report LoadReport(const std::string& path)
{
    try {
        const std::string text = ReadFile(path);
        const std::size_t first = text.find_first_not_of(" \t\r\n");
        const bool isJson = first != std::string::npos && text[first] == '{';
        return isJson ? ReadJson(text) : ReadText(text);
    } catch (const std::runtime_error& failure) {
        throw std::runtime_error(path + ": " + failure.what());
    }
}

} // namespace assay_host
