// The files of a machine in a temporary folder, for the time of a test.
#pragma once

#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>

#include <stdlib.h>

#include "identity/linux/Files.h"

namespace assay_host {

class MachineTree {
public:
    MachineTree()
    {
        std::string folder = (std::filesystem::temp_directory_path() / "identity-XXXXXX").string();
        if (::mkdtemp(folder.data()) == nullptr)
            throw std::runtime_error("can't make " + folder);
        fRoot = folder;
    }
    ~MachineTree()
    {
        std::error_code ignored;
        std::filesystem::remove_all(fRoot, ignored);
    }
    MachineTree(const MachineTree&) = delete;
    MachineTree& operator=(const MachineTree&) = delete;

    const std::string& GetRoot() const { return fRoot; }
    Files GetFiles() const { return Files(fRoot); }

    void Write(const std::string& path, const std::string& bytes) const
    {
        std::filesystem::create_directories(std::filesystem::path(fRoot + path).parent_path());
        std::ofstream file(fRoot + path, std::ios::binary | std::ios::trunc);
        file << bytes;
        if (!file.flush())
            throw std::runtime_error("can't write " + path);
    }

    void Link(const std::string& path, const std::string& target) const
    {
        std::filesystem::create_directories(std::filesystem::path(fRoot + path).parent_path());
        std::filesystem::create_symlink(target, fRoot + path);
    }

    void Remove(const std::string& path) const { std::filesystem::remove_all(fRoot + path); }

private:
    std::string fRoot;
};

} // namespace assay_host
