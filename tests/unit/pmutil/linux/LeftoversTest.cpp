// Fails the whole run if it leaves an open descriptor or a temporary file.
#include <cstdlib>
#include <dirent.h>
#include <gtest/gtest.h>
#include <string>
#include <unistd.h>
#include <vector>

namespace {

std::vector<std::string> ListDirectory(const std::string& path)
{
    std::vector<std::string> names;
    DIR* const directory = ::opendir(path.c_str());
    if (directory == nullptr)
        return names;
    while (const dirent* const entry = ::readdir(directory)) {
        const std::string name = static_cast<const char*>(entry->d_name);
        if (name != "." && name != "..")
            names.push_back(name);
    }
    ::closedir(directory);
    return names;
}

class Leftovers : public testing::Environment {
public:
    void SetUp() override
    {
        std::string directory = "/tmp/pmutil_tests_XXXXXX";
        ASSERT_NE(::mkdtemp(directory.data()), nullptr);
        fDirectory = directory;
        ::setenv("TMPDIR", fDirectory.c_str(), 1);
        fDescriptors = ListDirectory("/proc/self/fd").size();
    }

    void TearDown() override
    {
        EXPECT_EQ(ListDirectory("/proc/self/fd").size(), fDescriptors)
            << "a test left a descriptor open";
        EXPECT_EQ(ListDirectory(fDirectory), std::vector<std::string>())
            << "a test left a temporary file behind";
        ::rmdir(fDirectory.c_str());
    }

private:
    std::string fDirectory;
    std::size_t fDescriptors = 0;
};

testing::Environment* const gLeftovers = testing::AddGlobalTestEnvironment(new Leftovers);

} // namespace
