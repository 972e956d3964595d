#include "memory/Folder.h"

#include <stdexcept>

namespace assay_host {

namespace {

class UnusableFolder : public Folder {
public:
    explicit UnusableFolder(const std::string& reason) : fReason(reason) {}

    std::string GetProblem() const override { return fReason; }
    FileRead Read(const std::string& /*name*/, std::size_t /*maxBytes*/) override { return {}; }
    std::string Write(const std::string& /*name*/, const std::string& /*text*/) override
    {
        return fReason;
    }
    std::string Remove(const std::string& /*name*/) override { return fReason; }
    std::vector<FolderEntry> List() override { return {}; }
    LockTry TryLock() override { return {LockState::kFailed, nullptr, fReason}; }

private:
    const std::string fReason;
};

} // namespace

std::unique_ptr<Folder> OpenUsableFolder(const std::string& path)
{
    std::unique_ptr<Folder> folder = OpenFolder(path, FolderUse::kRead);
    if (const std::string problem = folder->GetProblem(); !problem.empty())
        throw std::runtime_error(path + ": " + problem);
    return folder;
}

std::unique_ptr<Folder> MakeUnusableFolder(const std::string& reason)
{
    return std::make_unique<UnusableFolder>(reason);
}

bool IsTemporaryName(const std::string& name)
{
    constexpr char kEnding[] = ".tmp";
    constexpr std::size_t kSize = sizeof kEnding - 1;
    return name.size() > kSize && name.front() == '.' &&
           name.compare(name.size() - kSize, kSize, kEnding) == 0;
}

} // namespace assay_host
