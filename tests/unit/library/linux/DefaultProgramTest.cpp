// The program that runs if the host names none.
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include <filesystem>
#include <fstream>
#include <string>

#include <stdlib.h>

#include "Runs.h"
#include "library/DefaultProgram.h"

namespace {

namespace fs = std::filesystem;

TEST(LibraryProgram, IsTheOneOfTheLibrarysInstallation)
{
    // In the build folder, too, the library lies two folders below the folder of programs' parent.
    const fs::path program = fs::canonical("/proc/self/exe").parent_path() / "assay";
    if (!fs::exists(program))
        GTEST_SKIP() << program << " isn't built";
    assay_host_options* const options = assay_host_options_new();
    assay_host_options_add_argument(options, "-help");
    assay_host_result* result = nullptr;
    ASSERT_EQ(assay_host_run(options, nullptr, &result), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_result_verdict(result), ASSAY_HOST_USAGE_ERROR);
    const auto json = nlohmann::json::parse(assay_host_result_document(result, nullptr));
    EXPECT_EQ(json["command"][0], program.string());
    EXPECT_EQ(json["command"][1], "-help");
    EXPECT_EQ(json["versions"]["assay"]["value"], ASSAY_VERSION);
    assay_host_result_free(result);
    assay_host_options_free(options);
}

TEST(LibraryProgram, IsInTheFirstFolderThatHasOne)
{
    std::string root = (fs::temp_directory_path() / "program-XXXXXX").string();
    ASSERT_NE(::mkdtemp(root.data()), nullptr);
    const std::string first = root + "/lib";
    const std::string second = root + "/bin";
    const auto find = [&] { return assay_host::FindProgramIn({first, first + "/../bin"}); };
    fs::create_directory(first);
    fs::create_directory(second);
    EXPECT_EQ(find(), first + "/assay") << "there is none";
    std::ofstream(second + "/assay").flush();
    EXPECT_EQ(find(), second + "/assay");
    fs::create_directory(first + "/assay");
    EXPECT_EQ(find(), second + "/assay") << "a folder is no program";
    fs::remove(first + "/assay");
    std::ofstream(first + "/assay").flush();
    EXPECT_EQ(find(), first + "/assay");
    fs::remove_all(root);
}

} // namespace
