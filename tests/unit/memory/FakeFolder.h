// A folder in memory, with the faults of a real one.
#pragma once

#include <map>
#include <string>
#include <utility>

#include "memory/Folder.h"

namespace assay_host {

class FakeFolder : public Folder {
public:
    FileRead Read(const std::string& name, std::size_t maxBytes) override
    {
        ++fReads;
        const auto found = fFiles.find(name);
        if (found == fFiles.end())
            return {};
        if (found->second.size() > maxBytes)
            return {FileState::kRefused, {}, "it is too large"};
        return {FileState::kRead, found->second, {}};
    }

    std::string Write(const std::string& name, const std::string& text) override
    {
        ++fWrites;
        if (fWrites > fGoodWrites)
            return "No space left on device";
        fFiles[name] = text;
        fTimes[name] = ++fTime;
        return {};
    }

    std::string Remove(const std::string& name) override
    {
        if (!fCanRemove)
            return "Read-only file system";
        fFiles.erase(name);
        return {};
    }

    std::vector<FolderEntry> List() override
    {
        std::vector<FolderEntry> entries;
        for (const auto& file : fFiles)
            entries.push_back({file.first, fTimes[file.first]});
        return entries;
    }

    LockTry TryLock() override
    {
        if (!fCanLock)
            return {LockState::kFailed, nullptr, "No locks available"};
        if (fIsLocked)
            return {LockState::kBusy, nullptr, {}};
        fIsLocked = true;
        return {LockState::kHeld, std::make_unique<Held>(*this), {}};
    }

    // Returns the text of the only file but for the user's choice.
    std::string& GetState()
    {
        for (auto& [name, text] : fFiles)
            if (name != "choice.json")
                return text;
        return fFiles["none"];
    }

    std::map<std::string, std::string> fFiles;
    std::map<std::string, std::int64_t> fTimes;
    std::int64_t fTime = 0;
    int fReads = 0;
    int fWrites = 0;
    int fGoodWrites = 1000000; // the later ones fail
    bool fCanRemove = true;
    bool fCanLock = true;
    bool fIsLocked = false;

private:
    class Held : public FolderLock {
    public:
        explicit Held(FakeFolder& folder) : fFolder(folder) {}
        ~Held() override { fFolder.fIsLocked = false; }

    private:
        FakeFolder& fFolder;
    };
};

} // namespace assay_host
