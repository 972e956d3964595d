// What a result brings, with the lines of a report from the test child.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include <iomanip>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "Runs.h"

namespace {

using testing::HasSubstr;

// A report with one OpenGL device that passes its trials, up to its renderer. In hexadecimal, since
// Windows has no arguments of any bytes.
Words MakeReport(const Words& lines)
{
    std::ostringstream digits;
    digits << std::hex << std::setfill('0');
    for (const std::string& line : lines)
        for (const char byte : line + '\n')
            digits << std::setw(2) << static_cast<int>(static_cast<unsigned char>(byte));
    return {"raw", digits.str()};
}

const Words kReport = MakeReport({
    "assayStart=\"2026-11-22_01:00:00\"",
    "NumGLGPUs=1",
    "glgpu[0].GLVendor=\"?\"",
    "glgpu[0].GLRenderer=\"llvmpipe \xFF\"",
    "glgpu[0].GLMemoryMB=4096",
    "glgpu[0].CanCompileProgramGLSL=1",
    "glgpu[0].glGetIntegerv[GL_MAX_TEXTURE_UNITS]=[8, 16]",
    "glgpu[0].New=12345678901234567890",
});

TEST(LibraryResult, HasNoMoreWarningsThanItCounts)
{
    const ChildRun run(kReport);
    const std::size_t count = assay_host_result_warning_count(run.fResult);
    for (const std::size_t index : {count, count + 1, static_cast<std::size_t>(-1)}) {
        EXPECT_STREQ(assay_host_result_warning_code(run.fResult, index), "");
        EXPECT_STREQ(assay_host_result_warning_device(run.fResult, index), "");
        EXPECT_STREQ(assay_host_result_warning_text(run.fResult, index), "");
        EXPECT_STREQ(assay_host_result_warning_cause(run.fResult, index), "");
    }
}

TEST(LibraryResult, AnswersHaveTheirKinds)
{
    const ChildRun run(kReport);
    const auto find = [&](const char* key) { return assay_host_result_find(run.fResult, key); };
    std::size_t size = 0;

    EXPECT_EQ(assay_host_answer_kind(find("glgpu[0].GLMemoryMB")), ASSAY_HOST_NUMBER);
    EXPECT_EQ(assay_host_answer_number(find("glgpu[0].GLMemoryMB")), 4096);
    EXPECT_STREQ(assay_host_answer_text(find("glgpu[0].GLMemoryMB"), nullptr), "4096");
    EXPECT_STREQ(assay_host_answer_reason(find("glgpu[0].GLMemoryMB")), "");
    EXPECT_EQ(assay_host_answer_flag(find("glgpu[0].GLMemoryMB")), -1);

    EXPECT_EQ(assay_host_answer_kind(find("glgpu[0].GLRenderer")), ASSAY_HOST_TEXT);
    const char* const renderer = assay_host_answer_text(find("glgpu[0].GLRenderer"), &size);
    EXPECT_EQ(std::string(renderer, size), "llvmpipe \xFF");
    EXPECT_EQ(assay_host_answer_number(find("glgpu[0].GLRenderer")), 0);

    const assay_host_answer* const list = find("glgpu[0].glGetIntegerv[GL_MAX_TEXTURE_UNITS]");
    EXPECT_EQ(assay_host_answer_kind(list), ASSAY_HOST_LIST);
    ASSERT_EQ(assay_host_answer_list_size(list), 2U);
    EXPECT_EQ(assay_host_answer_list_item(list, 1), 16);
    EXPECT_EQ(assay_host_answer_list_item(list, 2), 0);

    EXPECT_EQ(assay_host_answer_flag(find("glgpu[0].CanCompileProgramGLSL")), 1);
    EXPECT_EQ(assay_host_answer_kind(find("glgpu[0].New")), ASSAY_HOST_TEXT)
        << "no number that a double keeps";

    EXPECT_EQ(assay_host_answer_kind(find("glgpu[0].GLVendor")), ASSAY_HOST_NOTHING);
    EXPECT_STREQ(assay_host_answer_text(find("glgpu[0].GLVendor"), nullptr), "?");
    EXPECT_STREQ(assay_host_answer_reason(find("glgpu[0].GLVendor")),
                 "the system's adapter lists do not have it");
    for (const char* unanswered : {"glgpu[0].GLVendor", "assayEnd"}) {
        EXPECT_EQ(assay_host_answer_flag(find(unanswered)), -1);
        EXPECT_EQ(assay_host_answer_number(find(unanswered)), 0);
        EXPECT_EQ(assay_host_answer_list_size(find(unanswered)), 0U);
    }
    EXPECT_EQ(assay_host_answer_kind(find("assayEnd")), ASSAY_HOST_NOTHING);
    EXPECT_STREQ(assay_host_answer_reason(find("assayEnd")), "run ended before");
    EXPECT_STREQ(assay_host_answer_text(find("assayEnd"), &size), "");
    EXPECT_EQ(size, 0U);
    EXPECT_EQ(find("glgpu[1].GLName"), nullptr);
    EXPECT_EQ(find(""), nullptr);
}

TEST(LibraryResult, EveryAnswerIsFoundByItsKey)
{
    const ChildRun run(kReport);
    const std::size_t count = assay_host_result_answer_count(run.fResult);
    EXPECT_GT(count, 20U);
    for (std::size_t index = 0; index < count; ++index) {
        const assay_host_answer* const answer = assay_host_result_answer(run.fResult, index);
        EXPECT_EQ(assay_host_result_find(run.fResult, assay_host_answer_key(answer)), answer);
        const bool isNothing = assay_host_answer_kind(answer) == ASSAY_HOST_NOTHING;
        EXPECT_EQ(*assay_host_answer_reason(answer) != '\0', isNothing)
            << assay_host_answer_key(answer);
    }
    EXPECT_EQ(assay_host_result_answer(run.fResult, count), nullptr);
}

TEST(LibraryResult, DevicesWarningsAndWhatCanBeUsed)
{
    const ChildRun run(kReport);
    ASSERT_EQ(assay_host_result_device_count(run.fResult), 1U);
    const assay_host_device* const device = assay_host_result_device(run.fResult, 0);
    EXPECT_STREQ(assay_host_device_tag(device), "glgpu[0]");
    EXPECT_EQ(assay_host_device_interface(device), ASSAY_HOST_OPENGL);
    EXPECT_EQ(assay_host_device_complete(device), 0);
    EXPECT_EQ(assay_host_device_failed(device), 0);
    EXPECT_EQ(assay_host_device_software(device), 1);
    EXPECT_EQ(assay_host_result_device(run.fResult, 1), nullptr);

    bool warned = false;
    for (std::size_t at = 0; at < assay_host_result_warning_count(run.fResult); ++at)
        warned = warned ||
                 (std::string(assay_host_result_warning_code(run.fResult, at)) == "software" &&
                  std::string(assay_host_result_warning_device(run.fResult, at)) == "glgpu[0]" &&
                  *assay_host_result_warning_text(run.fResult, at) != '\0');
    EXPECT_TRUE(warned);

    EXPECT_EQ(assay_host_result_usable(run.fResult, ASSAY_HOST_OPENGL), ASSAY_HOST_BROKEN);
    EXPECT_STREQ(assay_host_result_usable_reason(run.fResult, ASSAY_HOST_OPENGL), "ended");
    EXPECT_STRNE(assay_host_result_usable_text(run.fResult, ASSAY_HOST_OPENGL), "");
    EXPECT_EQ(assay_host_result_usable(run.fResult, ASSAY_HOST_OPENCL), ASSAY_HOST_UNKNOWN);
    EXPECT_STREQ(assay_host_result_usable_reason(run.fResult, ASSAY_HOST_OPENCL), "ended-before");
}

TEST(LibraryResult, TheDocumentSaysTheSameToAllThreads)
{
    const ChildRun run(kReport);
    std::vector<const char*> documents(4);
    std::vector<std::thread> threads;
    for (const char*& document : documents)
        threads.emplace_back([&] { document = assay_host_result_document(run.fResult, nullptr); });
    for (std::thread& thread : threads)
        thread.join();
    for (const char* const document : documents)
        EXPECT_EQ(document, documents[0]);
    std::size_t size = 0;
    const std::string text(assay_host_result_document(run.fResult, &size));
    EXPECT_EQ(text.size(), size);
    const auto json = nlohmann::json::parse(text);
    EXPECT_EQ(json["schema"], 2);
    EXPECT_EQ(json["usable"]["opengl"]["answer"], "broken");
    EXPECT_EQ(json["environment"]["host"]["known"], false);
    EXPECT_EQ(json["devices"][0]["keys"]["GLMemoryMB"]["number"], 4096);
}

TEST(LibraryResult, TheDocumentNamesTheMachineOnRequest)
{
    Options options;
    EXPECT_EQ(assay_host_options_set_identify(options, 1), ASSAY_HOST_OK);
    const ChildRun run(kWhole, options);
    const auto json = nlohmann::json::parse(assay_host_result_document(run.fResult, nullptr));
    EXPECT_EQ(json["environment"]["host"]["known"], true);
}

} // namespace
