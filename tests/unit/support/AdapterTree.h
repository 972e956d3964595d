// The kernel's files of a recorded machine, unpacked from tests/data/adapters for one test.
#pragma once

#include <string>
#include <vector>

// Unpacks tests/data/adapters/NAME/tree.txt to a temporary folder and makes that the system root.
// The destructor restores the real root and removes the folder.
class AdapterTree {
public:
    explicit AdapterTree(const std::string& name);
    ~AdapterTree();
    AdapterTree(const AdapterTree&) = delete;
    AdapterTree& operator=(const AdapterTree&) = delete;

    // The unpacked folder.
    const std::string& root() const { return fRoot; }

    // Returns the full paths of the unpacked files, sorted.
    std::vector<std::string> files() const;

    // Writes a file below the root and makes its folder if necessary; then calls refresh.
    void write(const std::string& path, const std::string& text) const;

    // Removes a file or folder below the root; then calls refresh.
    void remove(const std::string& path) const;

    // Makes cached adapter data stale.
    void refresh() const;

private:
    std::string fRoot;
};

// Returns the names of the trees, sorted.
std::vector<std::string> AdapterTreeNames();

// Returns the text of a file in a tree's folder in tests/data/adapters.
std::string ReadAdapterData(const std::string& tree, const std::string& file);
