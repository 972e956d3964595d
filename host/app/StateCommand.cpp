#include <algorithm>
#include <cstdio>
#include <memory>
#include <stdexcept>

#include <fmt/format.h>

#include "app/Commands.h"
#include "memory/Machine.h"
#include "memory/StateForms.h"
#include "memory/Store.h"
#include "output/Output.h"
#include "report/Bytes.h"

namespace assay_host {

namespace {

// Returns the entries that the words name by the start of their names; all of them without a word.
std::vector<StoredKnowledge> Find(Store& store, const std::vector<std::string>& words)
{
    std::vector<StoredKnowledge> all = store.List();
    if (words.empty())
        return all;
    std::vector<StoredKnowledge> found;
    for (const std::string& word : words) {
        const auto matches = [&word](const StoredKnowledge& entry) {
            return entry.fName.compare(0, word.size(), word) == 0;
        };
        const auto count = std::count_if(all.begin(), all.end(), matches);
        if (count != 1 || word.empty())
            throw std::runtime_error(fmt::format("{} entries begin with \"{}\"", count, word));
        found.push_back(*std::find_if(all.begin(), all.end(), matches));
    }
    return found;
}

void Check(const std::string& reason)
{
    if (!reason.empty())
        throw std::runtime_error("cannot change the state: " + reason);
}

void Forget(Store& store, Folder& folder, const std::vector<std::string>& words)
{
    // A process that makes an attempt would write the entry again.
    const LockTry lock = folder.TryLock();
    if (lock.fState == LockState::kBusy)
        throw std::runtime_error("another process makes an attempt; call again");
    if (words.empty())
        Check(store.ForgetAll());
    else
        for (const StoredKnowledge& entry : Find(store, words))
            Check(store.Forget(entry.fName));
}

void Set(Store& store, const std::vector<std::string>& words, std::int64_t now)
{
    Choice choice = store.LoadChoice();
    for (const std::string& word : words) {
        const auto read = ReadChoiceWord(word);
        if (!read)
            throw std::runtime_error(fmt::format(
                "\"{}\" is not opengl= or opencl= with hardware, software, absent or auto", word));
        choice.Get(read->fKind).reset();
        if (read->fUsability)
            choice.Get(read->fKind) = {*read->fUsability, now};
    }
    Check(store.SaveChoice(choice));
}

} // namespace

int State(const StateChoice& choice)
{
    const bool isChange =
        choice.fAction == StateAction::kForget || choice.fAction == StateAction::kSet;
    const std::unique_ptr<Folder> folder =
        isChange ? OpenFolder(choice.fState, FolderUse::kWrite) : OpenUsableFolder(choice.fState);
    Store store(*folder);
    const std::int64_t now = MakeSystemMachine()->GetTime();
    std::string text;
    switch (choice.fAction) {
    case StateAction::kList:
        text = MakeStateList(store.List(), store.LoadChoice(), now);
        break;
    case StateAction::kShow:
        for (const StoredKnowledge& entry : Find(store, choice.fWords))
            text += MakeStateText(entry);
        break;
    case StateAction::kForget:
        Forget(store, *folder, choice.fWords);
        break;
    case StateAction::kSet:
        Set(store, choice.fWords, now);
        break;
    }
    for (const std::string& message : store.GetMessages())
        std::fprintf(stderr, "assay-host: %s\n", message.c_str());
    OpenStandardOutput()->Write(text);
    return 0;
}

} // namespace assay_host
