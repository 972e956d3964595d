// A machine's files as the kernel shows them, unpacked from tests/data/adapters for one test.
#pragma once

#include <string>
#include <vector>

// Unpacks tests/data/adapters/NAME/tree.txt into a folder of its own and makes that the system
// root. The destructor brings the real root back and removes the folder.
class AdapterTree {
public:
    explicit AdapterTree(const std::string& name);
    ~AdapterTree();
    AdapterTree(const AdapterTree&) = delete;
    AdapterTree& operator=(const AdapterTree&) = delete;

    // The unpacked folder.
    const std::string& root() const { return fRoot; }

    // The paths of the unpacked files, with the root.
    std::vector<std::string> files() const;

    // Writes a file below the root, its folder too, and lets the next question look afresh.
    void write(const std::string& path, const std::string& text) const;

    // Removes what is at that path below the root, and lets the next question look afresh.
    void remove(const std::string& path) const;

    // Makes the next question look at the adapters afresh.
    void refresh() const;

private:
    std::string fRoot;
};

// The names of the trees, sorted.
std::vector<std::string> AdapterTreeNames();

// A file of a tree's folder in tests/data/adapters.
std::string ReadAdapterData(const std::string& tree, const std::string& file);
