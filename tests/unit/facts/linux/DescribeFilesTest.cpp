#include "facts/DescribeFiles.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include <link.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include "facts/linux/ElfNotes.h"

namespace assay_host {
namespace {

LoadedFile Describe(const std::string& path)
{
    std::vector<LoadedFile> files(1);
    files.front().fPath = path;
    DescribeFiles(files);
    return files.front();
}

TEST(DescribeFiles, FindsTheVersionInTheName)
{
    EXPECT_EQ(Describe("/no/libEGL.so.1.1.0").fVersion.fValue, "1.1.0");
    EXPECT_EQ(Describe("/no/libnvidia-eglcore.so.550.54.15").fVersion.fValue, "550.54.15");
    EXPECT_EQ(Describe("/no/x.so.2/libclang-cpp.so.15").fVersion.fValue, "15");
    EXPECT_EQ(Describe("/no/libgallium-25.0.7-2.so").fVersion.fValue, "25.0.7-2");
    EXPECT_EQ(Describe("/no/libLLVM-15.so.1").fVersion.fValue, "15");
    EXPECT_EQ(Describe("/no/libx-1.so").fVersion.fValue, "1");
    EXPECT_EQ(Describe("/no/-1.so").fVersion.fValue, "1");
    EXPECT_EQ(Describe("/no/libx.so.9").fVersion.fValue, "9");
    EXPECT_EQ(Describe("/no/libglib-2.0.so.0.7400.6").fVersion.fValue, "0.7400.6");
    for (const char* path :
         {"/no/iris_dri.so", "/no/x-1.so.2/libm.so", "", "/x.so.", "/libx.so.b",
          "/no/libxcb-dri2.so", "/no/libx-a1.so", "/no/lib-1", "/no/libx.so-1"}) {
        const Fact version = Describe(path).fVersion;
        EXPECT_EQ(version.fValue, "") << path;
        EXPECT_EQ(version.fReason, "the file's name has none");
    }
}

TEST(DescribeFiles, FindsTheBuildIdThatTheLoadedLibraryHas)
{
    // The notes in memory, of each library of this program that has a build id.
    std::vector<std::pair<std::string, std::string>> loaded;
    dl_iterate_phdr(
        [](dl_phdr_info* info, std::size_t, void* list) {
            for (int index = 0; index < info->dlpi_phnum; ++index) {
                const ElfW(Phdr)& segment = info->dlpi_phdr[index];
                const std::string name = info->dlpi_name;
                if (segment.p_type != PT_NOTE || name.find('/') == std::string::npos)
                    continue;
                const std::string notes(
                    reinterpret_cast<const char*>(info->dlpi_addr + segment.p_vaddr),
                    segment.p_memsz);
                const std::string id = FindNote(notes, ELF_NOTE_GNU, NT_GNU_BUILD_ID);
                if (!id.empty())
                    static_cast<decltype(loaded)*>(list)->emplace_back(name, MakeHexText(id));
            }
            return 0;
        },
        &loaded);
    if (loaded.empty())
        GTEST_SKIP() << "no library of this program has a build id";
    for (const auto& [path, id] : loaded)
        EXPECT_EQ(Describe(path).fBuildId.fValue, id) << path;
}

class DescribeFilesInFolder : public testing::Test {
protected:
    void SetUp() override
    {
        char folder[] = "/tmp/describe-XXXXXX";
        ASSERT_NE(mkdtemp(folder), nullptr);
        fFolder = folder;
    }
    void TearDown() override { std::filesystem::remove_all(fFolder); }

    std::string fFolder;
};

TEST_F(DescribeFilesInFolder, FollowsSymbolicLinks)
{
    std::ofstream(fFolder + "/libEGL_x.so.1.2.3") << "not an ELF file";
    std::filesystem::create_symlink("libEGL_x.so.1.2.3", fFolder + "/libEGL_x.so.1");
    const LoadedFile file = Describe(fFolder + "/libEGL_x.so.1");
    EXPECT_EQ(file.fPath, fFolder + "/libEGL_x.so.1.2.3");
    EXPECT_EQ(file.fVersion.fValue, "1.2.3");
    EXPECT_EQ(file.fBuildId.fReason, "the file has none");
}

TEST_F(DescribeFilesInFolder, MayBeUnreadable)
{
    const std::string path = fFolder + "/libx.so.1";
    std::ofstream(path) << "not an ELF file";
    ASSERT_EQ(chmod(fFolder.c_str(), 0755), 0);
    ASSERT_EQ(chmod(path.c_str(), 0), 0);
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        constexpr uid_t kNobody = 65534;
        if (geteuid() == 0 && seteuid(kNobody) != 0)
            _exit(2);
        _exit(Describe(path).fBuildId.fReason == "the file can't be read" ? 0 : 1);
    }
    int status = -1;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0);
}

TEST_F(DescribeFilesInFolder, OpensOnlyFiles)
{
    const std::string pipe = fFolder + "/libpipe.so.1";
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    for (const std::string& path : {pipe, fFolder, fFolder + "/gone.so.1"}) {
        const LoadedFile file = Describe(path);
        EXPECT_EQ(file.fPath, path);
        EXPECT_EQ(file.fBuildId.fReason, "the file can't be read") << path;
    }
}

} // namespace
} // namespace assay_host
