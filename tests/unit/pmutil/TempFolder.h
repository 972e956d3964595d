// A temporary folder for the time of a test.
#pragma once

#include <fstream>
#include <iterator>
#include <sstream>
#include <string>

#include <boost/filesystem/operations.hpp>

namespace pmutil {

class TempFolder {
public:
    TempFolder()
        : fPath(boost::filesystem::temp_directory_path() /
                boost::filesystem::unique_path("pmutil-%%%%-%%%%-%%%%"))
    {
        boost::filesystem::create_directory(fPath);
    }
    ~TempFolder()
    {
        boost::system::error_code ignored;
        boost::filesystem::remove_all(fPath, ignored);
    }
    TempFolder(const TempFolder&) = delete;
    TempFolder& operator=(const TempFolder&) = delete;

    const boost::filesystem::path& Path() const { return fPath; }
    std::string File(const std::string& name) const { return (fPath / name).string(); }

private:
    boost::filesystem::path fPath;
};

// Reads a text file. Line ends are newlines on every platform.
inline std::string ReadWhole(const std::string& path)
{
    std::ifstream file(path);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

} // namespace pmutil
