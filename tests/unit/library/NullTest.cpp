// What is read from null, and beyond the end of each list.
#include <gtest/gtest.h>

#include <string>
#include <utility>

#include "Advices.h"
#include "Runs.h"

namespace {

// A size that a function which must set it leaves behind.
constexpr std::size_t kUnset = 99;

TEST(LibraryNull, AResultHasOnlyDefaults)
{
    constexpr const assay_host_result* kNone = nullptr;
    EXPECT_EQ(assay_host_result_verdict(kNone), ASSAY_HOST_NEVER_STARTED);
    EXPECT_STREQ(assay_host_result_reason(kNone), "");
    int status = 5;
    EXPECT_EQ(assay_host_result_exit_status(kNone, &status), 0);
    EXPECT_EQ(status, 5);
    EXPECT_STREQ(assay_host_result_termination(kNone), "");
    EXPECT_EQ(assay_host_result_seconds(kNone), 0);
    EXPECT_EQ(assay_host_result_error_line_count(kNone), 0U);
    EXPECT_EQ(assay_host_result_lost_bytes(kNone), 0U);
    EXPECT_EQ(assay_host_result_lost_error_bytes(kNone), 0U);
    EXPECT_EQ(assay_host_result_left_behind(kNone), 0);
    for (const assay_host_interface which : {ASSAY_HOST_OPENGL, ASSAY_HOST_OPENCL}) {
        EXPECT_EQ(assay_host_result_usable(kNone, which), ASSAY_HOST_UNKNOWN);
        EXPECT_STREQ(assay_host_result_usable_reason(kNone, which), "");
        EXPECT_STREQ(assay_host_result_usable_text(kNone, which), "");
        EXPECT_STREQ(assay_host_result_usable_device(kNone, which), "");
    }
    EXPECT_EQ(assay_host_result_warning_count(kNone), 0U);
    EXPECT_STREQ(assay_host_result_warning_code(kNone, 0), "");
    EXPECT_STREQ(assay_host_result_warning_device(kNone, 0), "");
    EXPECT_STREQ(assay_host_result_warning_text(kNone, 0), "");
    EXPECT_STREQ(assay_host_result_warning_cause(kNone, 0), "");
    EXPECT_EQ(assay_host_result_device_count(kNone), 0U);
    EXPECT_EQ(assay_host_result_device(kNone, 0), nullptr);
    EXPECT_EQ(assay_host_result_answer_count(kNone), 0U);
    EXPECT_EQ(assay_host_result_answer(kNone, 0), nullptr);
    EXPECT_EQ(assay_host_result_find(kNone, "NumGLGPUs"), nullptr);
}

TEST(LibraryNull, TextsOfAResultAreEmptyAndHaveASize)
{
    constexpr const assay_host_result* kNone = nullptr;
    std::size_t size = kUnset;
    EXPECT_STREQ(assay_host_result_last_line(kNone, &size), "");
    EXPECT_EQ(size, 0U);
    size = kUnset;
    EXPECT_STREQ(assay_host_result_last_log_line(kNone, &size), "");
    EXPECT_EQ(size, 0U);
    size = kUnset;
    EXPECT_STREQ(assay_host_result_error_line(kNone, 0, &size), "");
    EXPECT_EQ(size, 0U);
    EXPECT_STREQ(assay_host_result_error_line(kNone, 0, nullptr), "");
    size = kUnset;
    EXPECT_EQ(assay_host_result_document(kNone, &size), nullptr);
    EXPECT_EQ(size, 0U);
}

void ExpectNoAdvice(const assay_host_advice* advice, assay_host_interface which)
{
    EXPECT_EQ(assay_host_advice_usable(advice, which), ASSAY_HOST_UNKNOWN);
    EXPECT_EQ(assay_host_advice_learnt(advice, which), ASSAY_HOST_UNKNOWN);
    for (const auto read :
         {assay_host_advice_reason, assay_host_advice_text, assay_host_advice_source,
          assay_host_advice_device, assay_host_advice_end, assay_host_advice_end_text,
          assay_host_advice_change, assay_host_advice_warning})
        EXPECT_STREQ(read(advice, which), "");
    for (const auto read : {assay_host_advice_device_name, assay_host_advice_device_driver,
                            assay_host_advice_last_line}) {
        std::size_t size = kUnset;
        EXPECT_STREQ(read(advice, which, &size), "");
        EXPECT_EQ(size, 0U);
        EXPECT_STREQ(read(advice, which, nullptr), "");
    }
    for (const auto read : {assay_host_advice_age, assay_host_advice_next_attempt}) {
        double seconds = 5;
        EXPECT_EQ(read(advice, which, &seconds), 0);
        EXPECT_EQ(seconds, 5);
    }
    EXPECT_EQ(assay_host_advice_failures(advice, which), 0U);
}

TEST(LibraryNull, AnAdviceHasOnlyDefaults)
{
    constexpr const assay_host_advice* kNone = nullptr;
    const StateFolder folder;
    const ChildAdvice made(folder);
    ExpectNoAdvice(kNone, ASSAY_HOST_OPENGL);
    ExpectNoAdvice(made.fAdvice, MakeNumber<assay_host_interface>(2)); // there is no such interface
    EXPECT_EQ(assay_host_advice_plan(kNone), ASSAY_HOST_ANSWER);
    EXPECT_STREQ(assay_host_advice_due(kNone), "");
    EXPECT_EQ(assay_host_advice_tried(kNone), 0);
    EXPECT_EQ(assay_host_advice_stopped(kNone), 0);
    EXPECT_STREQ(assay_host_advice_identity(kNone), "");
    EXPECT_EQ(assay_host_advice_attempts(kNone), 0U);
    EXPECT_EQ(assay_host_advice_message_count(kNone), 0U);
    EXPECT_STREQ(assay_host_advice_message(kNone, 0), "");
    std::size_t size = kUnset;
    EXPECT_STREQ(assay_host_advice_document(kNone, &size), "");
    EXPECT_EQ(size, 0U);
}

TEST(LibraryNull, ADeviceHasOnlyDefaults)
{
    EXPECT_STREQ(assay_host_device_tag(nullptr), "");
    EXPECT_EQ(assay_host_device_interface(nullptr), ASSAY_HOST_OPENGL);
    EXPECT_EQ(assay_host_device_complete(nullptr), 0);
    EXPECT_EQ(assay_host_device_failed(nullptr), 0);
    EXPECT_EQ(assay_host_device_software(nullptr), -1);
}

TEST(LibraryNull, AnAnswerHasOnlyDefaults)
{
    EXPECT_STREQ(assay_host_answer_key(nullptr), "");
    EXPECT_EQ(assay_host_answer_kind(nullptr), ASSAY_HOST_NOTHING);
    EXPECT_STREQ(assay_host_answer_reason(nullptr), "no such key");
    std::size_t size = kUnset;
    EXPECT_STREQ(assay_host_answer_text(nullptr, &size), "");
    EXPECT_EQ(size, 0U);
    EXPECT_EQ(assay_host_answer_number(nullptr), 0);
    EXPECT_EQ(assay_host_answer_flag(nullptr), -1);
    EXPECT_EQ(assay_host_answer_list_size(nullptr), 0U);
    EXPECT_EQ(assay_host_answer_list_item(nullptr, 0), 0);
}

TEST(LibraryNull, OptionsAndCallbacks)
{
    EXPECT_EQ(assay_host_options_set_program(nullptr, "x"), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_add_argument(nullptr, "x"), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_set_timeout(nullptr, 1), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_set_identify(nullptr, 1), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_on_line(nullptr, nullptr, nullptr), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_on_error_line(nullptr, nullptr, nullptr), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_options_on_tick(nullptr, nullptr, nullptr), ASSAY_HOST_NULL_POINTER);
    const Options options;
    EXPECT_EQ(assay_host_options_add_argument(options, ""), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_options_set_timeout(options, 0), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_options_set_identify(options, 0), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_options_on_line(options, nullptr, nullptr), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_options_on_error_line(options, nullptr, nullptr), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_options_on_tick(options, nullptr, nullptr), ASSAY_HOST_OK);
    assay_host_options* const one = assay_host_options_new();
    for (const auto set : {assay_host_options_set_max_bytes, assay_host_options_set_max_line_bytes,
                           assay_host_options_set_max_lines})
        EXPECT_EQ(set(one, 1), ASSAY_HOST_OK);
    assay_host_options_free(one);
}

TEST(LibraryNull, AFailedRunLeavesNoResult)
{
    assay_host_result* result = reinterpret_cast<assay_host_result*>(&result);
    const Options options;
    assay_host_options_set_program(options, "no-such-program");
    ASSERT_EQ(assay_host_run(options, nullptr, &result), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_result_find(result, nullptr), nullptr);
    EXPECT_EQ(assay_host_result_exit_status(result, nullptr), 0);
    std::size_t size = kUnset;
    EXPECT_STREQ(assay_host_result_last_line(result, &size), "");
    EXPECT_EQ(size, 0U);
    EXPECT_STREQ(assay_host_result_last_log_line(result, &size), "");
    EXPECT_STREQ(assay_host_result_error_line(result, 0, &size), "");
    const std::size_t warnings = assay_host_result_warning_count(result);
    EXPECT_STREQ(assay_host_result_warning_code(result, warnings), "");
    EXPECT_STREQ(assay_host_result_warning_device(result, warnings), "");
    EXPECT_STREQ(assay_host_result_warning_text(result, warnings), "");
    EXPECT_STREQ(assay_host_result_warning_cause(result, warnings), "");
    assay_host_result_free(result);
}

} // namespace
