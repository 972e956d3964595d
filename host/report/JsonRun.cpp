#include "report/JsonRun.h"

#include <stdexcept>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/JsonBytes.h"
#include "report/JsonMembers.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

bool IsNull(const Json& object, const char* name)
{
    const auto member = object.find(name);
    return member != object.end() && member->is_null();
}

const Json& GetObject(const Json& object, const std::string& where, const char* name)
{
    return GetMember(object, where, name, &Json::is_object, "an object");
}

std::string ReadText(const Json& object, const std::string& where, const char* name)
{
    return DecodeBytes(GetString(object, where, name));
}

// An empty text is written as null.
std::string ReadTextOrNull(const Json& object, const std::string& where, const char* name)
{
    return IsNull(object, name) ? std::string() : ReadText(object, where, name);
}

std::vector<std::string> ReadTexts(const Json& object, const std::string& where, const char* name)
{
    std::vector<std::string> texts;
    for (const Json& text : GetMember(object, where, name, &Json::is_array, "an array")) {
        if (!text.is_string())
            throw std::runtime_error(
                fmt::format("{}: \"{}\" has an element that is not a string", where, name));
        texts.push_back(DecodeBytes(text.get<std::string>()));
    }
    return texts;
}

double ReadNumber(const Json& object, const std::string& where, const char* name)
{
    return GetMember(object, where, name, &Json::is_number, "a number").get<double>();
}

std::uint64_t ReadCount(const Json& object, const std::string& where, const char* name)
{
    return GetMember(object, where, name, &Json::is_number_unsigned, "a count")
        .get<std::uint64_t>();
}

Verdict ReadVerdict(const Json& object, const std::string& where)
{
    const std::string name = GetString(object, where, "verdict");
    for (const Verdict verdict :
         {Verdict::kComplete, Verdict::kFailedTests, Verdict::kUsageError, Verdict::kCrashed,
          Verdict::kHung, Verdict::kNeverStarted, Verdict::kInterrupted})
        if (name == GetVerdictName(verdict))
            return verdict;
    throw std::runtime_error(
        fmt::format("{}: \"verdict\" is \"{}\", which is none", where, ShowBytes(name)));
}

std::vector<Cause> ReadCauses(const Json& outcome, const std::string& where)
{
    std::vector<Cause> causes;
    // The first schema has none.
    if (!outcome.contains("causes"))
        return causes;
    for (const Json& cause : GetMember(outcome, where, "causes", &Json::is_array, "an array"))
        causes.push_back({ReadText(cause, where + ".causes", "key"),
                          ReadText(cause, where + ".causes", "text")});
    return causes;
}

std::vector<LowerBound> ReadLowerBounds(const Json& outcome, const std::string& where)
{
    std::vector<LowerBound> bounds;
    // The first schema has none.
    if (!outcome.contains("lowerBounds"))
        return bounds;
    const std::string inside = where + ".lowerBounds";
    for (const Json& bound : GetMember(outcome, where, "lowerBounds", &Json::is_array, "an array"))
        bounds.push_back({ReadText(bound, inside, "key"), ReadNumber(bound, inside, "value")});
    return bounds;
}

Fact ReadFact(const Json& object, const std::string& where, const char* name)
{
    const Json& fact = GetObject(object, where, name);
    const std::string inside = where + "." + name;
    if (GetMember(fact, inside, "known", &Json::is_boolean, "a bool").get<bool>())
        return {ReadText(fact, inside, "value"), {}};
    std::string reason = ReadText(fact, inside, "reason");
    return {{}, reason.empty() ? "no reason is given" : std::move(reason)};
}

DeviceKind ReadInterface(const Json& file, const std::string& where)
{
    const std::string name = GetString(file, where, "interface");
    for (const DeviceKind kind : {DeviceKind::kOpenGL, DeviceKind::kOpenCL})
        if (name == GetKindName(kind))
            return kind;
    throw std::runtime_error(
        fmt::format("{}: \"interface\" is \"{}\", which is none", where, ShowBytes(name)));
}

LoadedFiles ReadDrivers(const Json& object, const std::string& where)
{
    // The first schema has none.
    if (!object.contains("drivers"))
        return {{}, "the document does not have them"};
    const Json& drivers = GetObject(object, where, "drivers");
    const std::string inside = where + ".drivers";
    if (!GetMember(drivers, inside, "known", &Json::is_boolean, "a bool").get<bool>()) {
        std::string reason = ReadText(drivers, inside, "reason");
        return {{}, reason.empty() ? "no reason is given" : std::move(reason)};
    }
    LoadedFiles files;
    for (const Json& file : GetMember(drivers, inside, "files", &Json::is_array, "an array"))
        files.fFiles.push_back({ReadInterface(file, inside), ReadText(file, inside, "path"),
                                ReadFact(file, inside, "version"),
                                ReadFact(file, inside, "buildId")});
    return files;
}

} // namespace

RunOutcome ReadOutcome(const Json& object, const std::string& where)
{
    const Json& json = GetObject(object, where, "outcome");
    const std::string inside = where + ".outcome";
    RunOutcome outcome;
    outcome.fVerdict = ReadVerdict(json, inside);
    if (!IsNull(json, "exitStatus"))
        outcome.fExitStatus =
            GetMember(json, inside, "exitStatus", &Json::is_number_integer, "an integer")
                .get<int>();
    outcome.fTermination = ReadTextOrNull(json, inside, "termination");
    outcome.fReason = ReadText(json, inside, "reason");
    outcome.fSeconds = ReadNumber(json, inside, "seconds");
    if (!IsNull(json, "timeoutSeconds"))
        outcome.fTimeoutSeconds = ReadNumber(json, inside, "timeoutSeconds");
    outcome.fLastReportLine = ReadTextOrNull(json, inside, "lastReportLine");
    outcome.fLastLogLine = ReadTextOrNull(json, inside, "lastLogLine");
    outcome.fErrorLines = ReadTexts(json, inside, "errorLines");
    outcome.fLostOutputBytes = ReadCount(json, inside, "lostOutputBytes");
    outcome.fLostErrorBytes = ReadCount(json, inside, "lostErrorBytes");
    outcome.fLeftBehind =
        GetMember(json, inside, "leftBehind", &Json::is_boolean, "a bool").get<bool>();
    outcome.fCauses = ReadCauses(json, inside);
    outcome.fLowerBounds = ReadLowerBounds(json, inside);
    outcome.fDrivers = ReadDrivers(object, where);
    return outcome;
}

std::vector<std::string> ReadCommand(const Json& object, const std::string& where)
{
    return ReadTexts(object, where, "command");
}

RunFacts ReadFacts(const Json& object, const std::string& where)
{
    RunFacts facts;
    const Json& versions = GetObject(object, where, "versions");
    const std::string inVersions = where + ".versions";
    facts.fHostVersion = ReadFact(versions, inVersions, "assay-host").fValue;
    facts.fChildVersion = ReadFact(versions, inVersions, "assay");
    const Json& environment = GetObject(object, where, "environment");
    const std::string inside = where + ".environment";
    Environment& read = facts.fEnvironment;
    read.fTime = ReadText(environment, inside, "time");
    read.fOffset = ReadText(environment, inside, "utcOffset");
    read.fSystem = ReadFact(environment, inside, "system");
    read.fBuild = ReadFact(environment, inside, "build");
    read.fKernel = ReadFact(environment, inside, "kernel");
    read.fArchitecture = ReadFact(environment, inside, "architecture");
    read.fHost = ReadFact(environment, inside, "host");
    return facts;
}

RunFacts MakeUnknownFacts(const std::string& reason)
{
    const Fact unknown = {{}, reason};
    RunFacts facts;
    facts.fChildVersion = unknown;
    facts.fEnvironment = {unknown, unknown, unknown, unknown, unknown, {}, {}};
    return facts;
}

} // namespace assay_host
