#include "memory/Store.h"

#include <algorithm>
#include <string_view>
#include <utility>

#include <fmt/format.h>

#include "memory/Envelope.h"
#include "memory/KnowledgeJson.h"
#include "report/Bytes.h"

namespace assay_host {

namespace {

constexpr char kChoiceName[] = "choice.json";
constexpr std::string_view kEnding = ".json";
constexpr std::size_t kDigestSize = 36;

// A temporary file of this age isn't being written any more.
constexpr std::int64_t kTemporarySeconds = 3600;

std::string MakeFileName(const std::string& identityName)
{
    return identityName + std::string(kEnding);
}

// Returns the identity's name of a file's name; empty for other files.
std::string ReadFileName(const std::string& name)
{
    if (name.size() != kDigestSize + kEnding.size() || name.substr(kDigestSize) != kEnding)
        return {};
    const std::string digest = name.substr(0, kDigestSize);
    return digest.find_first_not_of("0123456789abcdef-") == std::string::npos ? digest
                                                                              : std::string();
}

// Returns the text of the file, without the oldest attempts if it would be too large.
std::string MakeText(const Knowledge& knowledge)
{
    std::string text = Seal(MakeKnowledgeJson(knowledge));
    for (Knowledge shorter = knowledge;
         text.size() > kMaxStateBytes && shorter.fAttempts.size() > 1;) {
        shorter.fAttempts.erase(shorter.fAttempts.begin());
        text = Seal(MakeKnowledgeJson(shorter));
    }
    return text;
}

bool IsNewer(const FileRead& read)
{
    return Unseal(read.fText).fSoundness == Soundness::kNewer;
}

} // namespace

void Store::AddMessage(const std::string& message)
{
    if (std::find(fMessages.begin(), fMessages.end(), message) == fMessages.end())
        fMessages.push_back(message);
}

std::optional<nlohmann::ordered_json> Store::Read(const std::string& name, std::string& problem)
{
    const FileRead read = fFolder.Read(name, kMaxStateBytes);
    if (read.fState == FileState::kMissing)
        return std::nullopt;
    if (read.fState == FileState::kRefused) {
        problem = read.fReason;
        return std::nullopt;
    }
    Opened opened = Unseal(read.fText);
    if (opened.fSoundness == Soundness::kSound)
        return std::move(opened.fContent);
    problem = opened.fSoundness == Soundness::kNewer ? "it is of a newer version" : "it is damaged";
    return std::nullopt;
}

const Store::Named& Store::Name(const Identity& identity)
{
    if (!fNamed || fNamed->fIdentity != identity) {
        nlohmann::ordered_json json = MakeIdentityJson(identity);
        std::string name = GetIdentityName(json);
        fNamed = Named{identity, std::move(json), std::move(name)};
    }
    return *fNamed;
}

const std::string& Store::GetName(const Identity& identity)
{
    return Name(identity).fName;
}

std::string Store::GetFileName(const Identity& identity)
{
    return MakeFileName(GetName(identity));
}

Knowledge Store::Load(const Identity& identity)
{
    const std::string name = GetFileName(identity);
    Knowledge knowledge;
    std::string problem;
    if (const auto content = Read(name, problem)) {
        try {
            if (content->at("identity") == Name(identity).fJson)
                knowledge = ReadAttemptsJson(*content);
            else
                problem = "it is of another identity";
        } catch (const std::exception&) {
            problem = "it is damaged";
        }
    }
    if (!problem.empty())
        AddMessage(fmt::format("The state file {} is ignored: {}.", name, ShowBytes(problem)));
    knowledge.fIdentity = identity;
    return knowledge;
}

bool Store::Save(const Knowledge& knowledge, std::int64_t now)
{
    const std::string name = GetFileName(knowledge.fIdentity);
    const FileRead present = fFolder.Read(name, kMaxStateBytes);
    std::string reason;
    if (IsNewer(present)) {
        reason = "the file of a newer version is kept";
    } else {
        const std::string text = MakeText(knowledge);
        reason = text.size() > kMaxStateBytes ? "it is too large" : fFolder.Write(name, text);
    }
    if (!reason.empty()) {
        AddMessage(fmt::format("The state can't be kept: {}.", ShowBytes(reason)));
        return false;
    }
    if (present.fState == FileState::kMissing)
        RemoveOldest(name, now);
    return true;
}

void Store::Drop(const Identity& identity)
{
    const std::string name = GetFileName(identity);
    if (!IsNewer(fFolder.Read(name, kMaxStateBytes)))
        fFolder.Remove(name);
}

Choice Store::LoadChoice()
{
    std::string problem;
    if (const auto content = Read(kChoiceName, problem)) {
        try {
            return ReadChoiceJson(*content);
        } catch (const std::exception&) {
            problem = "it is damaged";
        }
    }
    if (!problem.empty())
        AddMessage(fmt::format("The user's choice is ignored: {}.", ShowBytes(problem)));
    return {};
}

std::string Store::SaveChoice(const Choice& choice)
{
    if (choice.IsEmpty())
        return fFolder.Remove(kChoiceName);
    return fFolder.Write(kChoiceName, Seal(MakeChoiceJson(choice)));
}

std::vector<StoredKnowledge> Store::List()
{
    std::vector<StoredKnowledge> list;
    for (const FolderEntry& entry : fFolder.List()) {
        const std::string identityName = ReadFileName(entry.fName);
        if (identityName.empty())
            continue;
        StoredKnowledge stored;
        stored.fName = identityName;
        stored.fTime = entry.fTime;
        if (const auto content = Read(entry.fName, stored.fProblem)) {
            try {
                stored.fKnowledge = ReadKnowledgeJson(*content);
            } catch (const std::exception&) {
                stored.fProblem = "it is damaged";
            }
        }
        list.push_back(std::move(stored));
    }
    std::sort(list.begin(), list.end(), [](const auto& left, const auto& right) {
        return std::make_pair(right.fTime, left.fName) < std::make_pair(left.fTime, right.fName);
    });
    return list;
}

std::string Store::Forget(const std::string& name)
{
    return fFolder.Remove(MakeFileName(name));
}

std::string Store::ForgetAll()
{
    std::string reason = fFolder.Remove(kChoiceName);
    for (const FolderEntry& entry : fFolder.List()) {
        if (ReadFileName(entry.fName).empty() && !IsTemporaryName(entry.fName))
            continue;
        std::string failure = fFolder.Remove(entry.fName);
        if (reason.empty())
            reason = std::move(failure);
    }
    return reason;
}

void Store::RemoveOldest(const std::string& kept, std::int64_t now)
{
    std::vector<FolderEntry> files;
    for (FolderEntry& entry : fFolder.List())
        if (IsTemporaryName(entry.fName) && now - entry.fTime > kTemporarySeconds)
            fFolder.Remove(entry.fName);
        else if (!ReadFileName(entry.fName).empty() && entry.fName != kept)
            files.push_back(std::move(entry));
    if (files.size() < kMaxIdentities)
        return;
    std::sort(files.begin(), files.end(), [](const auto& left, const auto& right) {
        return std::make_pair(left.fTime, left.fName) < std::make_pair(right.fTime, right.fName);
    });
    files.resize(files.size() - (kMaxIdentities - 1));
    for (const FolderEntry& file : files)
        fFolder.Remove(file.fName);
}

} // namespace assay_host
