#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
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
#include "support/TempPath.h"

namespace assay_host {
namespace {

// A file that no other process has, deleted with its object.
class File {
public:
    explicit File(const std::string& text, const std::string& name = "assay-report-file")
        : fPath(MakeTempPath(name))
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
        EXPECT_EQ(Load(std::string(70000, ' ') + document.dump()), text);
        EXPECT_EQ(Load(MakeEvents(text)), text);
        EXPECT_EQ(Load(" \t" + MakeEvents(text)), text);
    }
    EXPECT_EQ(Load("\n \na=1\n"), "\n \na=1\n");
    // The limit of a string is not one of a report, where a quote may stay open.
    std::string open = "a=1\n";
    for (int line = 0; line < 20000; ++line)
        open += "# " + std::string(60, 'x') + (line == 2000 ? "\"\n" : "\n");
    EXPECT_EQ(Load(open).size(), open.size());
    EXPECT_EQ(Load(MakeDocument({}, {}).dump()), "");
}

TEST(ReportFile, AReportAloneHasNoFacts)
{
    const File file("a=1\n");
    const StoredRun run = LoadRun(file.fPath);
    EXPECT_EQ(run.fReport.ToText(), "a=1\n");
    EXPECT_EQ(run.fExtent, OutcomeExtent::kNone);
    const Environment& environment = run.fFacts.fEnvironment;
    for (const Fact* fact : {&run.fFacts.fChildVersion, &environment.fSystem, &environment.fBuild,
                             &environment.fKernel, &environment.fArchitecture, &environment.fHost})
        EXPECT_EQ(fact->fReason, "the file has only the report");
    EXPECT_EQ(run.fFacts.fHostVersion, "");
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
    EXPECT_EQ(LoadFailure("a=" + std::string((1 << 16) - 1, 'x')),
              "lines too long, or too many, for a report");
    EXPECT_EQ(LoadFailure("{").substr(0, 16), "not valid JSON: ");
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
    const auto getFailure = [&file, &limits] {
        ReportInput input(file.fPath, limits);
        input.ExpectJson();
        std::istream stream(&input);
        try {
            ReadDocument(stream);
        } catch (const std::runtime_error& failure) {
            return std::string(failure.what());
        }
        return std::string();
    };
    limits.fMaxBytes = 100001;
    EXPECT_EQ(getFailure(), "too large for a report");
    limits.fMaxBytes = 100002;
    EXPECT_EQ(getFailure(), "the document: \"schema\" is missing");
}

// The longest string or number of a text in JSON is as long as said here.
TEST(ReportFile, LimitsEachStringAndNumber)
{
    const struct {
        const char* fText;
        std::size_t fSize;
    } rows[] = {
        {R"({"a": "123\"567"})", 8},
        {R"({"a": "12\\", "b": 1})", 4},
        {R"({"a": "1\\\"5", "b": 1})", 6},
        {R"({"abc": -12.5})", 5},
        {R"({"a b,c:d": 1})", 7},
        {R"({"a{}[]b": 1})", 6},
        {R"({"a":[12,34],"b":{"c":0}})", 2},
        {"{\"a\"\t:\r\n12\n}", 2},
    };
    for (const auto& row : rows) {
        const File file(row.fText);
        const auto read = [&file](std::size_t size) {
            ReportInput::Limits limits;
            limits.fMaxWordBytes = size;
            ReportInput input(file.fPath, limits);
            input.ExpectJson();
            std::string text;
            while (input.sgetc() != std::char_traits<char>::eof())
                text += static_cast<char>(input.sbumpc());
            return text;
        };
        EXPECT_EQ(read(row.fSize), row.fText);
        EXPECT_THROW(read(row.fSize - 1), std::runtime_error) << row.fText;
    }
}

// A document is told from events by the first line, of which no more than this is read.
TEST(ReportFile, LimitsTheFirstEvent)
{
    const auto load = [](std::size_t size) {
        std::vector<std::string> command = {""};
        const std::size_t other = MakeFirstStartEvent(command).size() - 1; // without the line end
        const std::size_t more = size - other;
        for (std::size_t word = 0; word < more / 1003 - 1; ++word)
            command.emplace_back(1000, 'x');
        command[0] = std::string(more - (command.size() - 1) * 1003, 'x');
        const std::string start = MakeFirstStartEvent(command);
        EXPECT_EQ(start.size(), size + 1);
        const File file(start + MakeFirstEndEvent({}));
        return LoadReport(file.fPath);
    };
    constexpr std::size_t kMax = std::size_t{4} << 20;
    EXPECT_TRUE(load(kMax).GetLines().empty());
    EXPECT_THROW(load(kMax + 1), std::runtime_error);
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
    // A folder can be opened on some systems.
    try {
        LoadReport(testing::TempDir());
        ADD_FAILURE();
    } catch (const std::runtime_error& failure) {
        const std::string text = failure.what();
        EXPECT_NE(text.find(": can't "), std::string::npos) << text;
        EXPECT_TRUE(text.find("can't open: ") != std::string::npos ||
                    text.find("can't read: ") != std::string::npos)
            << text;
    }
    EXPECT_THROW(LoadReport(""), std::runtime_error);
}

} // namespace
} // namespace assay_host
