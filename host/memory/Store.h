// The files of the state: what is known of each identity, and the user's choice.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "memory/Attempt.h"
#include "memory/Choice.h"
#include "memory/Folder.h"

namespace assay_host {

// Files with the knowledge of identities that are kept.
constexpr std::size_t kMaxIdentities = 32;

// A file of the state that Store::List found.
struct StoredKnowledge {
    std::string fName; // of GetIdentityName
    std::int64_t fTime = 0;
    std::optional<Knowledge> fKnowledge; // empty if the file can't be read
    std::string fProblem;                // why
};

// A damaged, a foreign and a newer file are as if absent. A damaged one is replaced, a newer one is
// left as it is, so that nothing is kept. Not synchronized.
class Store {
public:
    explicit Store(Folder& folder) : fFolder(folder) {}

    // Returns GetIdentityName().
    const std::string& GetName(const Identity& identity);

    // Returns what is known of the identity; nothing but the identity if there is no file.
    Knowledge Load(const Identity& identity);

    // Writes what is known of an identity. Returns false if it can't be kept. Removes the files
    // that are the oldest, if there are too many.
    bool Save(const Knowledge& knowledge, std::int64_t now);

    // Removes the file of an identity, without a message. One of a newer version stays.
    void Drop(const Identity& identity);

    Choice LoadChoice();

    // Writes the user's choice. Returns the reason if it can't be kept.
    std::string SaveChoice(const Choice& choice);

    // Returns the files, the newest first.
    std::vector<StoredKnowledge> List();

    // Removes the file of this name of an identity. Returns the reason if it can't.
    std::string Forget(const std::string& name);

    // Removes the choice and all that is known. Returns the first reason if it can't.
    std::string ForgetAll();

    // Returns each problem with the files once, as a sentence.
    const std::vector<std::string>& GetMessages() const { return fMessages; }

    void AddMessage(const std::string& message);

private:
    std::optional<nlohmann::ordered_json> Read(const std::string& name, std::string& problem);
    void RemoveOldest(const std::string& kept, std::int64_t now);

    // An identity in its other forms, which take longer to make than all else of an answer.
    struct Named {
        Identity fIdentity;
        nlohmann::ordered_json fJson;
        std::string fName;
    };

    const Named& Name(const Identity& identity);
    std::string GetFileName(const Identity& identity);

    Folder& fFolder;
    std::vector<std::string> fMessages;
    std::optional<Named> fNamed; // the last one
};

} // namespace assay_host
