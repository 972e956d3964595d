#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <random>
#include <stdexcept>
#include <string>
#include <system_error>

#include "Lines.h"
#include "Samples.h"
#include "SavedJson.h"
#include "report/JsonEvents.h"
#include "report/JsonReader.h"
#include "report/ReportFile.h"
#include "report/ReportInput.h"

namespace assay_host {
namespace {

// A file that no other process has, deleted with its object.
class File {
public:
    explicit File(const std::string& text, const std::string& name = "assay-report-file")
        : fPath(testing::TempDir() + name + "-" + std::to_string(std::random_device()()))
    {
        std::ofstream file(std::filesystem::u8path(fPath), std::ios::binary);
        file << text;
    }
    ~File()
    {
        std::error_code ignored;
        std::filesystem::remove(std::filesystem::u8path(fPath), ignored);
    }
    File(const File&) = delete;
    File& operator=(const File&) = delete;

    const std::string fPath;
};

std::string LoadFailure(const std::string& text)
{
    const File file(text);
    try {
        LoadReport(file.fPath);
    } catch (const std::runtime_error& failure) {
        const std::string message = failure.what();
        EXPECT_EQ(message.substr(0, file.fPath.size() + 2), file.fPath + ": ");
        return message.substr(file.fPath.size() + 2);
    }
    return "no failure";
}

std::string Load(const std::string& text)
{
    const File file(text);
    return LoadReport(file.fPath).ToText();
}

std::string MakeEvents(const std::string& text)
{
    std::string events = MakeFirstStartEvent({"assay"});
    for (const ReportLine& line : ReadLines(text))
        events += MakeLineEvent(line, 1);
    return events + MakeFirstEndEvent({});
}

TEST(ReportFile, LoadsEachForm)
{
    for (const std::string& text :
         {Sample(1, 1).GetText(), std::string("x\na=\"\xFF\r\n\"\r\n# log"), std::string("a=1")}) {
        EXPECT_EQ(Load(text), text);
        const Json document = MakeDocument(ReadReport(text), {});
        EXPECT_EQ(Load(document.dump(2) + "\n"), text);
        EXPECT_EQ(Load(document.dump()), text);
        EXPECT_EQ(Load(" \t\r\n" + document.dump(1)), text);
        EXPECT_EQ(Load(MakeEvents(text)), text);
    }
    EXPECT_EQ(Load("\n \na=1\n"), "\n \na=1\n");
    EXPECT_EQ(Load(MakeDocument({}, {}).dump()), "");
}

TEST(ReportFile, AcceptsAUnicodePath)
{
    const File file("a=1\n", "assay-r\xC3\xA9port-\xE4\xB8\xAD");
    EXPECT_EQ(LoadReport(file.fPath).ToText(), "a=1\n");
}

TEST(ReportFile, NamesTheErrorInAFile)
{
    EXPECT_EQ(LoadFailure(""), "neither a JSON document nor a report");
    EXPECT_EQ(LoadFailure("# only a comment\nand text"), "neither a JSON document nor a report");
    EXPECT_EQ(LoadFailure(std::string(300, '\xFF')), "neither a JSON document nor a report");
    EXPECT_EQ(LoadFailure("a=" + std::string(70000, 'x')),
              "lines too long, or too many, for a report");
    EXPECT_EQ(LoadFailure("{}"), "the document: \"schema\" is missing");
    EXPECT_EQ(LoadFailure("{\"event\": \"x\"}"), "line 1 is not the event \"start\"");
    EXPECT_EQ(LoadFailure("{\"schema\": 1").substr(0, 16), "not valid JSON: ");
    EXPECT_EQ(LoadFailure("{\"schema\": \"\xFF\"}").substr(0, 16), "not valid JSON: ");
    EXPECT_EQ(LoadFailure(std::string(200000, '{')).substr(0, 16), "not valid JSON: ");
    EXPECT_EQ(LoadFailure("{\"a\":" + std::string(200000, '[')).substr(0, 16), "not valid JSON: ");
    EXPECT_EQ(LoadFailure("{} {}").substr(0, 16), "not valid JSON: ");
}

TEST(ReportFile, RejectsLargeInputBeforeItIsHeld)
{
    const std::string large(std::size_t{5} << 20, 'x');
    EXPECT_EQ(LoadFailure("{\"a\": \"" + large + "\"}"), "too large for a report");
    EXPECT_EQ(LoadFailure("{\n\"a\": " + std::string(large.size(), '1') + "}"),
              "too large for a report");
    EXPECT_EQ(LoadFailure(MakeFirstStartEvent({}) + "{\"event\": \"" + large + "\"}\n"),
              "too large for a report");
    EXPECT_EQ(LoadFailure(std::string(large.size(), '\n')),
              "lines too long, or too many, for a report");
    const File file("{" + std::string(100000, ' ') + "}");
    ReportInput::Limits limits;
    limits.fMaxBytes = 100001;
    ReportInput input(file.fPath, limits);
    input.ExpectJson();
    std::istream stream(&input);
    EXPECT_THROW(ReadDocument(stream), std::runtime_error);
}

TEST(ReportFile, NamesANumberOutOfRange)
{
    EXPECT_EQ(LoadFailure("{\"schema\": 1, \"x\": 1e999}"), "number overflow parsing '1e999'");
}

TEST(ReportFile, NamesAFileThatCannotBeRead)
{
    const std::string path = testing::TempDir() + "assay-no-such-file";
    try {
        LoadReport(path);
        ADD_FAILURE();
    } catch (const std::runtime_error& failure) {
        EXPECT_EQ(failure.what(), path + ": can't open: No such file or directory");
    }
    EXPECT_THROW(LoadReport(testing::TempDir()), std::runtime_error);
    EXPECT_THROW(LoadReport(""), std::runtime_error);
}

} // namespace
} // namespace assay_host
