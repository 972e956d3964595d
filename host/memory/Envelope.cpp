#include "memory/Envelope.h"

#include <stdexcept>

#include <boost/uuid/name_generator_sha1.hpp>
#include <boost/uuid/uuid.hpp>
#include <boost/uuid/uuid_io.hpp>

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

// Deeper values are no content of any version, and would cost stack.
constexpr int kMaxDepth = 16;

std::string MakeChecksum(int format, const Json& content)
{
    return MakeDigest(std::to_string(format) + "\n" + content.dump());
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
    const Json file = {{"format", kStateFormat},
                       {"checksum", MakeChecksum(kStateFormat, content)},
                       {"content", content}};
    return file.dump(2) + "\n";
}

Opened Unseal(std::string_view text)
{
    try {
        Json file = Parse(text);
        const int format = file.at("format").get<int>();
        Json& content = file.at("content");
        if (file.at("checksum").get<std::string>() != MakeChecksum(format, content))
            return {};
        if (format != kStateFormat)
            return {format > kStateFormat ? Soundness::kNewer : Soundness::kDamaged};
        return {Soundness::kSound, std::move(content)};
    } catch (const std::exception&) {
        return {};
    }
}

} // namespace assay_host
