// Any bytes as a file of the state: checks that it is read or refused. A file with members replaced
// by any values, one for each line of the bytes: checks that it is read or refused, that what was
// read is written and read again as it was, and that it can be judged and shown.
#include <cstdint>
#include <exception>
#include <optional>
#include <sstream>
#include <string>
#include <vector>

#include "Require.h"
#include "memory/Closing.h"
#include "memory/Envelope.h"
#include "memory/KnowledgeJson.h"
#include "memory/Policy.h"
#include "memory/StateForms.h"
#include "report/JsonBytes.h"

namespace {

using namespace assay_host;
using Json = nlohmann::ordered_json;

constexpr int kAttempts = 3;

Json MakeContent()
{
    Knowledge knowledge;
    knowledge.fIdentity.fAdapters.resize(1);
    knowledge.fIdentity.fFiles.resize(1);
    for (int count = 0; count < kAttempts; ++count) {
        Attempt attempt;
        attempt.fExitStatus = count;
        AddAttempt(knowledge, attempt);
    }
    return MakeKnowledgeJson(knowledge);
}

// Replaces the member that the line's first byte selects by the rest of the line: a JSON value, or
// a text.
void Replace(Json& content, const std::vector<std::string>& places, const std::string& line)
{
    const std::string& place = places[static_cast<unsigned char>(line.front()) % places.size()];
    const std::string text = line.substr(1);
    Json value = Json::parse(text, nullptr, false);
    content[Json::json_pointer(place)] = value.is_discarded() ? Json(EncodeBytes(text)) : value;
}

std::optional<Knowledge> Read(const Json& content)
{
    try {
        return ReadKnowledgeJson(content);
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    Unseal(text);

    Json content = MakeContent();
    std::vector<std::string> places;
    const Json members = content.flatten();
    for (const auto& member : members.items())
        places.push_back(member.key());
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);)
        if (!line.empty()) {
            try {
                Replace(content, places, line);
            } catch (const std::exception&) {
                return 0; // an earlier line replaced what the place is in
            }
        }
    std::optional<Knowledge> knowledge = Read(content);
    if (!knowledge)
        return 0;
    const Json written = MakeKnowledgeJson(*knowledge);
    const Opened again = Unseal(Seal(written));
    Require(again.fSoundness == Soundness::kSound);
    Require(MakeKnowledgeJson(ReadKnowledgeJson(again.fContent)) == written);
    SettleOpen(knowledge->fAttempts, *MakeSystemMachine());
    for (const std::int64_t now : {std::int64_t(0), std::int64_t(1800000000), kLastTime})
        for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL}) {
            const Outlook outlook = Judge(kind, knowledge->fAttempts, now, Policy());
            Require(outlook.fFinding.fUsability != Usability::kHardware ||
                    outlook.fBasis->Get(kind).fUsability == Usability::kHardware);
        }
    MakeStateText({"name", 0, knowledge, ""});
    return 0;
}
