#include "memory/KnowledgeJson.h"

#include <charconv>
#include <stdexcept>
#include <string_view>
#include <system_error>

#include <fmt/format.h>

#include "memory/Machine.h"
#include "report/JsonBytes.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

constexpr Usability kUsabilities[] = {Usability::kHardware, Usability::kSoftware,
                                      Usability::kBroken, Usability::kAbsent, Usability::kUnknown};

// JSON numbers above 2^53 aren't exact in every reader.
Json MakeLarge(std::uint64_t number)
{
    return std::to_string(number);
}

template <typename T>
T ReadNumber(std::string_view word)
{
    T number = 0;
    const char* const end = word.data() + word.size();
    const auto result = std::from_chars(word.data(), end, number);
    if (result.ec != std::errc() || result.ptr != end)
        throw std::runtime_error("not a number");
    return number;
}

std::uint64_t ReadLarge(const Json& json)
{
    return ReadNumber<std::uint64_t>(json.get_ref<const std::string&>());
}

std::string ReadText(const Json& json)
{
    return DecodeBytes(json.get_ref<const std::string&>());
}

template <typename T>
T ReadInteger(const Json& json)
{
    if (!json.is_number_integer())
        throw std::runtime_error("not an integer");
    return json.get<T>();
}

// A time outside of these years would be one of a broken clock, and overflow in differences.
std::int64_t ReadTime(const Json& json)
{
    const auto time = ReadInteger<std::int64_t>(json);
    if (time < 0 || time > kLastTime)
        throw std::runtime_error("not a time");
    return time;
}

Json MakeAdapter(const AdapterIdentity& adapter)
{
    return {{"slot", EncodeBytes(adapter.fSlot)},
            {"vendor", adapter.fVendor},
            {"device", adapter.fDevice},
            {"driver", EncodeBytes(adapter.fDriver)},
            {"driverVersion", EncodeBytes(adapter.fDriverVersion)}};
}

AdapterIdentity ReadAdapter(const Json& json)
{
    AdapterIdentity adapter;
    adapter.fSlot = ReadText(json.at("slot"));
    adapter.fVendor = ReadInteger<unsigned>(json.at("vendor"));
    adapter.fDevice = ReadInteger<unsigned>(json.at("device"));
    adapter.fDriver = ReadText(json.at("driver"));
    adapter.fDriverVersion = ReadText(json.at("driverVersion"));
    return adapter;
}

// One text: interface, size, time, build id or "-", path. A machine has a hundred of them, and an
// object for each would cost more than all else of an answer.
Json MakeFile(const DriverFile& file)
{
    return fmt::format("{} {} {} {} {}", GetKindName(file.fInterface), file.fSize, file.fTime,
                       file.fBuildId.empty() ? "-" : EncodeBytes(file.fBuildId),
                       EncodeBytes(file.fPath));
}

// Removes the first word of a text and the blank after it, and returns the word.
std::string_view TakeWord(std::string_view& text)
{
    const std::size_t end = text.find(' ');
    if (end == std::string_view::npos)
        throw std::runtime_error("too few words");
    const std::string_view word = text.substr(0, end);
    text.remove_prefix(end + 1);
    return word;
}

DriverFile ReadFile(const Json& json)
{
    std::string_view rest = json.get_ref<const std::string&>();
    DriverFile file;
    const std::string_view interface = TakeWord(rest);
    if (interface == GetKindName(DeviceKind::kOpenCL))
        file.fInterface = DeviceKind::kOpenCL;
    else if (interface != GetKindName(DeviceKind::kOpenGL))
        throw std::runtime_error("an unknown interface");
    file.fSize = ReadNumber<std::uint64_t>(TakeWord(rest));
    file.fTime = ReadNumber<std::int64_t>(TakeWord(rest));
    const std::string_view buildId = TakeWord(rest);
    if (buildId != "-")
        file.fBuildId = DecodeBytes(std::string(buildId));
    file.fPath = DecodeBytes(std::string(rest));
    return file;
}

Identity ReadIdentity(const Json& json)
{
    Identity identity;
    for (const Json& adapter : json.at("adapters"))
        identity.fAdapters.push_back(ReadAdapter(adapter));
    for (const Json& file : json.at("files"))
        identity.fFiles.push_back(ReadFile(file));
    for (const Json& variable : json.at("variables"))
        identity.fVariables.push_back(ReadText(variable));
    identity.fSystem = ReadText(json.at("system"));
    identity.fAssayVersion = ReadText(json.at("assay"));
    return identity;
}

Json MakeHost(const HostMark& host)
{
    return {{"process", MakeLarge(host.fProcess)},
            {"start", MakeLarge(host.fStart)},
            {"boot", EncodeBytes(host.fBoot)},
            {"machine", EncodeBytes(host.fMachine)}};
}

HostMark ReadHost(const Json& json)
{
    return {ReadLarge(json.at("process")), ReadLarge(json.at("start")), ReadText(json.at("boot")),
            ReadText(json.at("machine"))};
}

Json MakeFinding(const Finding& finding)
{
    return {{"answer", GetUsabilityName(finding.fUsability)},
            {"reason", EncodeBytes(finding.fReason)},
            {"text", EncodeBytes(finding.fText)},
            {"tag", EncodeBytes(finding.fTag)},
            {"device", EncodeBytes(finding.fDevice)},
            {"driver", EncodeBytes(finding.fDriver)}};
}

Finding ReadFinding(const Json& json)
{
    return {ReadUsability(json.at("answer").get_ref<const std::string&>()),
            ReadText(json.at("reason")),
            ReadText(json.at("text")),
            ReadText(json.at("tag")),
            ReadText(json.at("device")),
            ReadText(json.at("driver"))};
}

Json MakeAttempt(const Attempt& attempt)
{
    return {{"end", GetAttemptEndName(attempt.fEnd)},
            {"started", attempt.fStarted},
            {"ended", attempt.fEnded},
            {"exitStatus", attempt.fExitStatus ? Json(*attempt.fExitStatus) : Json()},
            {"termination", EncodeBytes(attempt.fTermination)},
            {"reason", EncodeBytes(attempt.fReason)},
            {"lastLine", EncodeBytes(attempt.fLastLine)},
            {"host", MakeHost(attempt.fHost)},
            {"opengl", MakeFinding(attempt.fOpenGL)},
            {"opencl", MakeFinding(attempt.fOpenCL)}};
}

Attempt ReadAttempt(const Json& json)
{
    Attempt attempt;
    const auto end = ReadAttemptEnd(json.at("end").get_ref<const std::string&>());
    if (!end)
        throw std::runtime_error("an unknown end");
    attempt.fEnd = *end;
    attempt.fStarted = ReadTime(json.at("started"));
    attempt.fEnded = ReadTime(json.at("ended"));
    if (!json.at("exitStatus").is_null())
        attempt.fExitStatus = ReadInteger<int>(json.at("exitStatus"));
    attempt.fTermination = ReadText(json.at("termination"));
    attempt.fReason = ReadText(json.at("reason"));
    attempt.fLastLine = ReadText(json.at("lastLine"));
    attempt.fHost = ReadHost(json.at("host"));
    attempt.fOpenGL = ReadFinding(json.at("opengl"));
    attempt.fOpenCL = ReadFinding(json.at("opencl"));
    return attempt;
}

} // namespace

Usability ReadUsability(const std::string& name)
{
    for (const Usability usability : kUsabilities)
        if (name == GetUsabilityName(usability))
            return usability;
    throw std::runtime_error("an unknown answer");
}

Json MakeIdentityJson(const Identity& identity)
{
    Json adapters = Json::array();
    for (const AdapterIdentity& adapter : identity.fAdapters)
        adapters.push_back(MakeAdapter(adapter));
    Json variables = Json::array();
    for (const std::string& variable : identity.fVariables)
        variables.push_back(EncodeBytes(variable));
    Json files = Json::array();
    for (const DriverFile& file : identity.fFiles)
        files.push_back(MakeFile(file));
    return {{"system", EncodeBytes(identity.fSystem)},
            {"assay", EncodeBytes(identity.fAssayVersion)},
            {"adapters", adapters},
            {"variables", variables},
            {"files", files}};
}

Json MakeKnowledgeJson(const Knowledge& knowledge)
{
    Json attempts = Json::array();
    for (const Attempt& attempt : knowledge.fAttempts)
        attempts.push_back(MakeAttempt(attempt));
    return {{"count", MakeLarge(knowledge.fCount)},
            {"attempts", attempts},
            {"identity", MakeIdentityJson(knowledge.fIdentity)}};
}

Knowledge ReadKnowledgeJson(const Json& content)
{
    Knowledge knowledge = ReadAttemptsJson(content);
    knowledge.fIdentity = ReadIdentity(content.at("identity"));
    return knowledge;
}

Knowledge ReadAttemptsJson(const Json& content)
{
    Knowledge knowledge;
    knowledge.fCount = ReadLarge(content.at("count"));
    for (const Json& attempt : content.at("attempts"))
        knowledge.fAttempts.push_back(ReadAttempt(attempt));
    return knowledge;
}

std::string GetIdentityName(const Json& identity)
{
    // The files make up most of it. To dump them takes longer than to join them.
    std::string text = identity.at("adapters").dump() + identity.at("variables").dump();
    const auto add = [&text](const Json& json) {
        const auto& part = json.get_ref<const std::string&>();
        text += fmt::format("\n{} ", part.size()) + part;
    };
    add(identity.at("system"));
    add(identity.at("assay"));
    for (const Json& file : identity.at("files"))
        add(file);
    return MakeDigest(text);
}

} // namespace assay_host
