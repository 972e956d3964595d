#include "memory/Envelope.h"

#include <charconv>
#include <optional>
#include <stdexcept>
#include <system_error>

#include <boost/uuid/name_generator_sha1.hpp>
#include <boost/uuid/uuid.hpp>
#include <boost/uuid/uuid_io.hpp>

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

// Deeper values are no content of any version, and would cost stack.
constexpr int kMaxDepth = 16;

constexpr std::string_view kOpening = "{\n";
constexpr std::string_view kFormatStart = "{\n  \"format\": ";
constexpr std::string_view kChecksumStart = ",\n  \"checksum\": \"";
constexpr std::string_view kChecksumEnd = "\",\n";
constexpr std::size_t kChecksumSize = 36;

// The bytes of a file before and after the end of its checksum's line.
struct Parts {
    int fFormat = 0;
    std::string_view fChecksum;
    std::string_view fBody;
};

// Removes this start of a text. Returns false if the text has another one.
bool Take(std::string_view& text, std::string_view start)
{
    if (text.substr(0, start.size()) != start)
        return false;
    text.remove_prefix(start.size());
    return true;
}

std::optional<Parts> Split(std::string_view text)
{
    Parts parts;
    if (!Take(text, kFormatStart))
        return std::nullopt;
    const auto number = std::from_chars(text.data(), text.data() + text.size(), parts.fFormat);
    if (number.ec != std::errc())
        return std::nullopt;
    text.remove_prefix(static_cast<std::size_t>(number.ptr - text.data()));
    if (!Take(text, kChecksumStart))
        return std::nullopt;
    parts.fChecksum = text.substr(0, kChecksumSize);
    text.remove_prefix(parts.fChecksum.size());
    if (!Take(text, kChecksumEnd))
        return std::nullopt;
    parts.fBody = text;
    return parts;
}

std::string MakeChecksum(int format, std::string_view body)
{
    return MakeDigest(std::to_string(format).append("\n").append(body));
}

Json Parse(std::string_view text)
{
    const auto check = [](int depth, Json::parse_event_t /*event*/, Json& /*value*/) {
        if (depth > kMaxDepth)
            throw std::runtime_error("too deep");
        return true;
    };
    return Json::parse(text.begin(), text.end(), check);
}

} // namespace

std::string MakeDigest(std::string_view text)
{
    const boost::uuids::uuid space = {};
    return boost::uuids::to_string(
        boost::uuids::name_generator_sha1(space)(text.data(), text.size()));
}

std::string Seal(const Json& content)
{
    const Json file = {{"content", content}};
    const std::string body = file.dump(2).substr(kOpening.size()) + "\n";
    return std::string(kFormatStart)
        .append(std::to_string(kStateFormat))
        .append(kChecksumStart)
        .append(MakeChecksum(kStateFormat, body))
        .append(kChecksumEnd)
        .append(body);
}

Opened Unseal(std::string_view text)
{
    const std::optional<Parts> parts = Split(text);
    if (!parts || parts->fChecksum != MakeChecksum(parts->fFormat, parts->fBody))
        return {};
    if (parts->fFormat != kStateFormat)
        return {parts->fFormat > kStateFormat ? Soundness::kNewer : Soundness::kDamaged};
    try {
        Json file = Parse(std::string(kOpening).append(parts->fBody));
        return {Soundness::kSound, std::move(file.at("content"))};
    } catch (const std::exception&) {
        return {};
    }
}

} // namespace assay_host
