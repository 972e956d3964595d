#include "support/AdapterTree.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include "qgf/AdapterName.h"

namespace {

namespace fs = std::filesystem;

const char kData[] = ASSAY_TEST_DATA "/adapters/";

std::string Unescape(const std::string& text)
{
    std::string plain;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '\\') {
            plain += text[i];
            continue;
        }
        switch (text.at(++i)) {
        case 'n':
            plain += '\n';
            break;
        case 't':
            plain += '\t';
            break;
        case 'x':
            plain += static_cast<char>(std::stoi(text.substr(i + 1, 2), nullptr, 16));
            i += 2;
            break;
        default:
            plain += text[i];
        }
    }
    return plain;
}

void Write(const fs::path& path, const std::string& text, std::ios::openmode mode)
{
    std::ofstream file(path, std::ios::binary | mode);
    file << text;
    if (!file.flush())
        throw std::runtime_error("can't write " + path.string());
}

// Returns the unescaped rest of a line after a separator of `length` characters.
std::string RestAfter(const std::string& line, std::size_t separator, std::size_t length)
{
    return Unescape(line.substr(std::min(separator + length, line.size())));
}

// Unpacks the lines of a tree; tests/data/adapters/README.md describes them.
void Unpack(std::istream& tree, const fs::path& root)
{
    fs::path folder = root;
    fs::path file;
    for (std::string line; std::getline(tree, line);) {
        if (line.compare(0, 2, "@ ") == 0) {
            folder = root / line.substr(2);
            fs::create_directories(folder);
        } else if (line.compare(0, 2, "| ") == 0) {
            Write(file, Unescape(line.substr(2)) + "\n", std::ios::app);
        } else {
            const std::size_t blank = line.find(' ');
            const std::string kind = line.substr(std::min(blank, line.size()));
            file = folder / line.substr(0, blank);
            if (kind.compare(0, 4, " -> ") == 0)
                fs::create_symlink(kind.substr(4), file);
            else if (kind == " =")
                Write(file, "", std::ios::trunc);
            else if (kind.compare(0, 3, " = ") == 0)
                Write(file, RestAfter(kind, 0, 3) + "\n", std::ios::trunc);
            else if (kind.compare(0, 3, " :=") == 0)
                Write(file, RestAfter(kind, 0, 4), std::ios::trunc);
            else
                throw std::runtime_error("malformed line in a tree: " + line);
        }
    }
}

} // namespace

AdapterTree::AdapterTree(const std::string& name)
{
    std::ifstream tree(kData + name + "/tree.txt", std::ios::binary);
    if (!tree)
        throw std::runtime_error("unknown tree " + name);
    std::string folder = (fs::temp_directory_path() / "adapters-XXXXXX").string();
    if (!mkdtemp(folder.data()))
        throw std::runtime_error("can't make " + folder);
    fRoot = folder;
    Unpack(tree, fRoot);
    QGF::SetSystemRoot(fRoot);
}

AdapterTree::~AdapterTree()
{
    QGF::SetSystemRoot("");
    std::error_code ignored;
    fs::remove_all(fRoot, ignored);
}

std::vector<std::string> AdapterTree::files() const
{
    std::vector<std::string> paths;
    for (const auto& entry : fs::recursive_directory_iterator(fRoot))
        if (entry.symlink_status().type() == fs::file_type::regular)
            paths.push_back(entry.path().string());
    std::sort(paths.begin(), paths.end());
    return paths;
}

void AdapterTree::write(const std::string& path, const std::string& text) const
{
    const fs::path full = fRoot + path;
    fs::create_directories(full.parent_path());
    Write(full, text, std::ios::trunc);
    refresh();
}

void AdapterTree::remove(const std::string& path) const
{
    fs::remove_all(fRoot + path);
    refresh();
}

void AdapterTree::refresh() const
{
    QGF::SetSystemRoot(fRoot);
}

std::vector<std::string> AdapterTreeNames()
{
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(kData))
        if (entry.is_directory())
            names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

std::string ReadAdapterData(const std::string& tree, const std::string& file)
{
    std::ifstream in(kData + tree + "/" + file, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    if (!in)
        throw std::runtime_error("can't read " + file + " of tree " + tree);
    return text.str();
}
