#include "requirements/Requirement.h"

#include <algorithm>
#include <iterator>
#include <stdexcept>
#include <string_view>
#include <utility>
#include <vector>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/Numbers.h"
#include "report/SimilarName.h"

namespace assay_host {

namespace {

constexpr std::string_view kBlanks = " \t\r\n";
constexpr std::size_t kMaxBytes = 1000;

constexpr DeviceKind kKinds[] = {DeviceKind::kOpenGL, DeviceKind::kOpenCL};

struct RelationName {
    std::string_view fText;
    Relation fRelation;
};
// The longer ones first, since one begins like another.
constexpr RelationName kRelations[] = {{">=", Relation::kGreaterOrEqual},
                                       {"<=", Relation::kLessOrEqual},
                                       {"==", Relation::kEqual},
                                       {"!=", Relation::kNotEqual},
                                       {">", Relation::kGreater},
                                       {"<", Relation::kLess},
                                       {"=", Relation::kEqual}};

struct FactName {
    const char* fText;
    FactOf fFact;
};
constexpr FactName kFacts[] = {
    {"opengl.devices", {InterfaceFact::kDevices, DeviceKind::kOpenGL}},
    {"opencl.devices", {InterfaceFact::kDevices, DeviceKind::kOpenCL}},
    {"opengl.usable", {InterfaceFact::kUsable, DeviceKind::kOpenGL}},
    {"opencl.usable", {InterfaceFact::kUsable, DeviceKind::kOpenCL}},
};

// Returns the name that is the most similar to what was written; empty if none is similar.
std::string FindSimilar(std::string_view written)
{
    std::vector<std::string> names;
    for (const KnownKey& key : GetKnownKeys())
        names.push_back(key.fKey);
    for (const FactName& fact : kFacts)
        names.emplace_back(fact.fText);
    return FindSimilarName(written, names);
}

const KnownKey* FindKey(std::string_view name)
{
    for (const DeviceKind kind : kKinds)
        if (const KnownKey* const key = FindKnownKey(kind, name))
            return key;
    return FindKnownKey(std::nullopt, name);
}

// A hexadecimal number is one of ids.
std::optional<double> ReadWantedNumber(const std::string& text)
{
    constexpr std::string_view kHex = "0x";
    constexpr std::size_t kMaxHexBytes = 8;
    if (text.compare(0, kHex.size(), kHex) != 0)
        return ReadDouble(text);
    const std::string digits = text.substr(kHex.size());
    if (digits.empty() || digits.size() > kMaxHexBytes ||
        digits.find_first_not_of("0123456789abcdefABCDEF") != std::string::npos)
        return std::nullopt;
    return static_cast<double>(std::stoul(digits, nullptr, 16));
}

bool IsVersion(const KnownKey& key)
{
    constexpr std::string_view kVersions[] = {"Version", "VERSION]"};
    return std::any_of(std::begin(kVersions), std::end(kVersions), [&key](std::string_view end) {
        return key.fKey.size() > end.size() &&
               key.fKey.compare(key.fKey.size() - end.size(), end.size(), end) == 0;
    });
}

class Parser {
public:
    explicit Parser(std::string_view text) : fRest(text) {}

    Requirement Parse()
    {
        ParseSubject();
        ParseRelation();
        const std::string value = ParseValue();
        std::visit([&](const auto& subject) { SetWanted(subject, value); }, fResult.fSubject);
        return std::move(fResult);
    }

private:
    [[noreturn]] static void Fail(const std::string& reason) { throw std::runtime_error(reason); }

    void SkipBlanks()
    {
        fRest.remove_prefix(std::min(fRest.find_first_not_of(kBlanks), fRest.size()));
    }

    std::string_view TakeWord()
    {
        SkipBlanks();
        const std::string_view word = fRest.substr(0, fRest.find_first_of(" \t\r\n<>=!"));
        fRest.remove_prefix(word.size());
        SkipBlanks();
        return word;
    }

    void ParseSubject()
    {
        std::string_view word = TakeWord();
        if ((word == "all" || word == "any") && !fRest.empty() &&
            std::string_view("<>=!").find(fRest[0]) == std::string_view::npos) {
            fResult.fScope = word == "all" ? Scope::kAll : Scope::kAny;
            fHasScope = true;
            word = TakeWord();
        }
        if (word.empty())
            Fail("a key is missing");
        for (const FactName& fact : kFacts) {
            if (word == fact.fText) {
                fResult.fSubject = fact.fFact;
                CheckHasNoScope(word);
                return;
            }
        }
        const auto tag = GetDeviceTag(word);
        if (tag) {
            fResult.fDevice = ReadDeviceTag(*tag);
            if (fHasScope)
                Fail(fmt::format("\"all\" and \"any\" don't go with {}", *tag));
            fResult.fScope = Scope::kOne;
            word.remove_prefix(std::min(tag->size() + 1, word.size()));
        }
        const KnownKey* const key = FindKey(word);
        if (key == nullptr)
            FailUnknown(word);
        if (tag && key->fKind != fResult.fDevice->fKind)
            Fail(fmt::format("{} has no key {}", *tag, word));
        fResult.fSubject = key;
        if (!key->fKind)
            CheckHasNoScope(word);
    }

    void CheckHasNoScope(std::string_view word) const
    {
        if (fHasScope)
            Fail(
                fmt::format("\"all\" and \"any\" don't go with {}, which isn't of a device", word));
    }

    [[noreturn]] static void FailUnknown(std::string_view word)
    {
        const std::string similar = FindSimilar(word);
        Fail(fmt::format("there is no key \"{}\"{}", ShowBytes(word),
                         similar.empty() ? "" : "; did you mean " + similar + "?"));
    }

    void ParseRelation()
    {
        for (const RelationName& relation : kRelations) {
            if (fRest.substr(0, relation.fText.size()) == relation.fText) {
                fRest.remove_prefix(relation.fText.size());
                fResult.fRelation = relation.fRelation;
                return;
            }
        }
        Fail("one of ==, !=, <, <=, > and >= must follow the key");
    }

    // A value in quotes keeps its blanks; a quote or a backslash in it follows a backslash.
    std::string ParseValue()
    {
        SkipBlanks();
        fRest = fRest.substr(0, fRest.find_last_not_of(kBlanks) + 1);
        if (fRest.empty())
            Fail("a value is missing");
        if (fRest[0] != '"')
            return std::string(fRest);
        std::string value;
        std::size_t at = 1;
        for (; at < fRest.size() && fRest[at] != '"'; ++at) {
            if (fRest[at] == '\\' && at + 1 < fRest.size())
                ++at;
            value += fRest[at];
        }
        if (at + 1 != fRest.size())
            Fail(at < fRest.size() ? "text follows the closing quote"
                                   : "the closing quote is missing");
        return value;
    }

    void SetWanted(const FactOf& fact, const std::string& value)
    {
        if (fact.fFact == InterfaceFact::kDevices) {
            SetNumber(value);
            return;
        }
        CheckHasNoOrder("whether an interface can be used");
        for (const Usability usability :
             {Usability::kHardware, Usability::kSoftware, Usability::kBroken, Usability::kAbsent,
              Usability::kUnknown}) {
            if (value == GetUsabilityName(usability)) {
                fResult.fWanted = usability;
                return;
            }
        }
        Fail(fmt::format("\"{}\" is none of hardware, software, broken, absent and unknown",
                         ShowBytes(value)));
    }

    void SetWanted(const KnownKey* key, const std::string& value)
    {
        switch (key->fForm) {
        case ValueForm::kFlag:
            SetFlag(value);
            return;
        case ValueForm::kCount:
        case ValueForm::kTexels:
        case ValueForm::kMebibytes:
        case ValueForm::kId:
        case ValueForm::kBytesPerSecond:
        case ValueForm::kScore:
            SetNumber(value);
            return;
        case ValueForm::kText:
        case ValueForm::kAdapter:
        case ValueForm::kDate:
            break;
        }
        if (IsVersion(*key))
            SetVersion(value);
        else if (IsCount(*key))
            SetNumber(value);
        else {
            if (key->fForm != ValueForm::kDate)
                CheckHasNoOrder(key->fKey);
            fResult.fWanted = value;
        }
    }

    static bool IsCount(const KnownKey& key)
    {
        return std::any_of(std::begin(kKinds), std::end(kKinds),
                           [&key](DeviceKind kind) { return key.fKey == GetCountKey(kind); });
    }

    void SetFlag(const std::string& value)
    {
        CheckHasNoOrder("a flag");
        if (value == "1" || value == "true" || value == "yes")
            fResult.fWanted = 1.0;
        else if (value == "0" || value == "false" || value == "no")
            fResult.fWanted = 0.0;
        else
            Fail(fmt::format("\"{}\" is neither 0 nor 1", ShowBytes(value)));
    }

    void SetNumber(const std::string& value)
    {
        const auto number = ReadWantedNumber(value);
        if (!number)
            Fail(fmt::format("\"{}\" is no number", ShowBytes(value)));
        fResult.fWanted = *number;
    }

    void SetVersion(const std::string& value)
    {
        const auto version = ReadVersion(value);
        if (!version)
            Fail(fmt::format("\"{}\" has no version number", ShowBytes(value)));
        fResult.fWanted = *version;
    }

    void CheckHasNoOrder(std::string_view what) const
    {
        if (fResult.fRelation != Relation::kEqual && fResult.fRelation != Relation::kNotEqual)
            Fail(fmt::format("{} has no order: only == and != apply", what));
    }

    std::string_view fRest;
    Requirement fResult;
    bool fHasScope = false;
};

} // namespace

Requirement ParseRequirement(const std::string& text)
{
    try {
        if (text.size() > kMaxBytes)
            throw std::runtime_error(fmt::format("is longer than {} bytes", kMaxBytes));
        Requirement requirement = Parser(text).Parse();
        requirement.fText = text;
        return requirement;
    } catch (const std::runtime_error& failure) {
        throw std::runtime_error(
            fmt::format("\"{}\": {}", ShowBytes(text.substr(0, kMaxBytes)), failure.what()));
    }
}

} // namespace assay_host
