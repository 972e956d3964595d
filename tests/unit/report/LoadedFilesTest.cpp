#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "report/LoadedFiles.h"

namespace assay_host {
namespace {

using Texts = std::vector<std::string>;

Texts Read(const Texts& lines)
{
    LoadedFiles files{{}, "not known"};
    for (const std::string& line : lines)
        EXPECT_TRUE(TakeLoadedFile(line, files)) << line;
    EXPECT_TRUE(files.IsKnown());
    Texts texts;
    for (const LoadedFile& file : files.fFiles)
        texts.push_back(std::string(GetKindName(file.fInterface)) + " " + file.fPath);
    return texts;
}

TEST(LoadedFiles, AreReadFromTheLog)
{
    EXPECT_EQ(Read({"driver files are logged", "loaded for OpenGL: /usr/lib/libEGL.so.1.1.0",
                    "loaded for OpenCL: C:\\Windows\\System32\\OpenCL.dll",
                    "loaded for OpenGL: /a file with blanks: and a colon"}),
              (Texts{"OpenGL /usr/lib/libEGL.so.1.1.0", "OpenCL C:\\Windows\\System32\\OpenCL.dll",
                     "OpenGL /a file with blanks: and a colon"}));
}

TEST(LoadedFiles, AreNoneIfNoDriverWasLoaded)
{
    EXPECT_EQ(Read({"driver files are logged"}), Texts());
}

TEST(LoadedFiles, AreKnownWithoutTheFirstLine)
{
    EXPECT_EQ(Read({"loaded for OpenGL: /lib/libEGL.so.1"}), Texts{"OpenGL /lib/libEGL.so.1"});
}

TEST(LoadedFiles, AreListedOnce)
{
    EXPECT_EQ(Read({"loaded for OpenGL: /lib/libLLVM.so", "loaded for OpenCL: /lib/libLLVM.so"}),
              Texts{"OpenGL /lib/libLLVM.so"});
}

TEST(LoadedFiles, AreNoneOfEachPartOfTheRuntime)
{
    for (const std::string name :
         {"ld-linux.so.2", "libc.so.6", "libdl.so.2", "libgcc_s.so.1", "libm.so.6",
          "libpthread.so.0", "librt.so.1", "libstdc++.so.6", "api-ms-win-core-x.dll",
          "msvcp140.dll", "msvcrt.dll", "ucrtbase.dll", "vcruntime140.dll"})
        for (const char* folder : {"/lib/", "C:\\", ""})
            EXPECT_EQ(Read({"loaded for OpenGL: " + (folder + name)}), Texts()) << name;
    EXPECT_EQ(Read({"loaded for OpenGL: /libc.so.6/libx.so"}), Texts{"OpenGL /libc.so.6/libx.so"});
}

TEST(LoadedFiles, AreNotTheRuntime)
{
    EXPECT_EQ(Read({"loaded for OpenGL: /lib/libc.so.6", "loaded for OpenGL: /lib/libpthread.so.0",
                    "loaded for OpenGL: /lib/libstdc++.so.6.0.30",
                    "loaded for OpenGL: /lib/ld-linux-x86-64.so.2",
                    "loaded for OpenGL: C:\\windows\\system32\\MSVCP140.dll",
                    "loaded for OpenGL: C:\\windows\\system32\\ucrtbase.dll",
                    "loaded for OpenGL: C:\\windows\\system32\\API-MS-WIN-CORE.DLL",
                    "loaded for OpenGL: /lib/libcrypto.so.3"}),
              Texts{"OpenGL /lib/libcrypto.so.3"});
}

TEST(LoadedFiles, AreNoOtherLines)
{
    LoadedFiles files{{}, "not known"};
    for (const char* line :
         {"", "loaded", "loaded for ", "loaded for Vulkan: /b", "not loaded for OpenGL: /b",
          "loaded for OpenGL /b", "driver files", "driver files are logged here"})
        EXPECT_FALSE(TakeLoadedFile(line, files)) << line;
    EXPECT_FALSE(files.IsKnown());
    EXPECT_TRUE(TakeLoadedFile("loaded for OpenGL: ", files));
    EXPECT_TRUE(files.fFiles.empty());
}

TEST(LoadedFiles, AreBounded)
{
    LoadedFiles files;
    for (std::size_t index = 0; index < LoadedFiles::kMaxFiles + 9; ++index)
        EXPECT_TRUE(TakeLoadedFile("loaded for OpenGL: /" + std::to_string(index), files));
    EXPECT_EQ(files.fFiles.size(), LoadedFiles::kMaxFiles);
}

} // namespace
} // namespace assay_host
