// The user's choice, and what forgets the state.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <string>

#include "Advices.h"

namespace {

using testing::StartsWith;

class State {
public:
    explicit State(const char* folder)
    {
        EXPECT_EQ(assay_host_state_new(folder, &fState), ASSAY_HOST_OK);
    }
    ~State() { assay_host_state_free(fState); }
    State(const State&) = delete;
    State& operator=(const State&) = delete;

    operator assay_host_state*() const { return fState; }

    assay_host_choice GetChoice(assay_host_interface which = ASSAY_HOST_OPENGL) const
    {
        auto choice = MakeNumber<assay_host_choice>(99);
        EXPECT_EQ(assay_host_state_get_choice(fState, which, &choice), ASSAY_HOST_OK);
        return choice;
    }

    std::string GetMessage() const { return assay_host_state_message(fState); }

private:
    assay_host_state* fState = nullptr;
};

TEST(LibraryState, AChoiceReplacesAnAttempt)
{
    const StateFolder folder;
    const State state(folder.Get());
    EXPECT_EQ(state.GetChoice(), ASSAY_HOST_CHOICE_AUTO);
    EXPECT_FALSE(folder.Exists()) << "reading creates nothing";
    EXPECT_EQ(assay_host_state_set_choice(state, ASSAY_HOST_OPENGL, ASSAY_HOST_CHOICE_SOFTWARE),
              ASSAY_HOST_OK);
    EXPECT_EQ(state.GetChoice(), ASSAY_HOST_CHOICE_SOFTWARE);
    EXPECT_EQ(state.GetChoice(ASSAY_HOST_OPENCL), ASSAY_HOST_CHOICE_AUTO);
    const ChildAdvice made(folder);
    EXPECT_EQ(made.Show(), "software choice");
    EXPECT_EQ(assay_host_advice_learnt(made.fAdvice, ASSAY_HOST_OPENGL), ASSAY_HOST_UNKNOWN);
    EXPECT_STREQ(assay_host_advice_reason(made.fAdvice, ASSAY_HOST_OPENGL), "chosen");
    EXPECT_EQ(assay_host_state_set_choice(state, ASSAY_HOST_OPENGL, ASSAY_HOST_CHOICE_AUTO),
              ASSAY_HOST_OK);
    EXPECT_EQ(ChildAdvice(folder).Show(), "hardware attempt tried");
}

TEST(LibraryState, EachChoiceOfEachInterface)
{
    const StateFolder folder;
    const State state(folder.Get());
    constexpr assay_host_usability kAnswers[] = {ASSAY_HOST_HARDWARE, ASSAY_HOST_SOFTWARE,
                                                 ASSAY_HOST_ABSENT};
    for (const assay_host_interface which : {ASSAY_HOST_OPENGL, ASSAY_HOST_OPENCL})
        for (std::size_t index = 0; index < std::size(kAnswers); ++index) {
            const auto choice = static_cast<assay_host_choice>(index + 1);
            ASSERT_EQ(assay_host_state_set_choice(state, which, choice), ASSAY_HOST_OK);
            EXPECT_EQ(state.GetChoice(which), choice);
            const Options options;
            assay_host_options_set_dry_run(options, 1);
            const ChildAdvice made(folder, {}, options);
            EXPECT_EQ(assay_host_advice_usable(made.fAdvice, which), kAnswers[index]);
        }
    EXPECT_EQ(state.GetChoice(ASSAY_HOST_OPENGL), ASSAY_HOST_CHOICE_ABSENT) << "stays";
}

TEST(LibraryState, ForgetsAll)
{
    const StateFolder folder;
    const State state(folder.Get());
    EXPECT_EQ(ChildAdvice(folder, kCrashes).Show(), "broken attempt tried");
    assay_host_state_set_choice(state, ASSAY_HOST_OPENCL, ASSAY_HOST_CHOICE_ABSENT);
    EXPECT_EQ(assay_host_state_forget(state), ASSAY_HOST_OK);
    EXPECT_EQ(state.GetChoice(ASSAY_HOST_OPENCL), ASSAY_HOST_CHOICE_AUTO);
    const ChildAdvice made(folder);
    EXPECT_EQ(made.Show(), "hardware attempt tried");
    EXPECT_EQ(assay_host_advice_attempts(made.fAdvice), 1U);
    EXPECT_STREQ(assay_host_advice_warning(made.fAdvice, ASSAY_HOST_OPENGL), "");
}

TEST(LibraryState, IsBusyDuringAnAttempt)
{
    const StateFolder folder;
    const State state(folder.Get());
    Options options;
    assay_host_error error = ASSAY_HOST_OK;
    options.OnErrorLine([&](const std::string&) {
        error = assay_host_state_forget(state);
        return 0;
    });
    EXPECT_EQ(ChildAdvice(folder, kWorks + Words{"err", "x"}, options).Show(),
              "hardware attempt tried");
    EXPECT_EQ(error, ASSAY_HOST_BUSY);
    EXPECT_EQ(ChildAdvice(folder).Show(), "hardware memory");
}

TEST(LibraryState, AFolderThatCannotBeUsedHasAMessage)
{
    const StateFolder folder;
    const State state((std::string(folder.Get()) + "/none").c_str());
    EXPECT_EQ(assay_host_state_set_choice(state, ASSAY_HOST_OPENGL, ASSAY_HOST_CHOICE_SOFTWARE),
              ASSAY_HOST_NOT_CHANGED);
    EXPECT_THAT(state.GetMessage(), StartsWith("The state can't be changed: "));
    EXPECT_EQ(state.GetChoice(), ASSAY_HOST_CHOICE_AUTO);
    EXPECT_EQ(state.GetMessage(), "") << "of the last call";
    EXPECT_EQ(assay_host_state_forget(state), ASSAY_HOST_NOT_CHANGED);
    EXPECT_THAT(state.GetMessage(), StartsWith("The state can't be changed: "));
}

TEST(LibraryState, ADamagedChoiceIsIgnoredWithAMessage)
{
    const StateFolder folder;
    const State state(folder.Get());
    assay_host_state_set_choice(state, ASSAY_HOST_OPENGL, ASSAY_HOST_CHOICE_SOFTWARE);
    std::ofstream(std::filesystem::u8path(folder.Get()) / "choice.json", std::ios::app) << "x";
    EXPECT_EQ(state.GetChoice(), ASSAY_HOST_CHOICE_AUTO);
    EXPECT_EQ(state.GetMessage(), "The user's choice is ignored: it is damaged.");
    EXPECT_EQ(assay_host_state_set_choice(state, ASSAY_HOST_OPENGL, ASSAY_HOST_CHOICE_HARDWARE),
              ASSAY_HOST_OK);
    EXPECT_EQ(state.GetMessage(), "");
    EXPECT_EQ(state.GetChoice(), ASSAY_HOST_CHOICE_HARDWARE);
}

TEST(LibraryState, ArgumentsOutOfRange)
{
    assay_host_state* none = nullptr;
    EXPECT_EQ(assay_host_state_new("x", nullptr), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_state_new(nullptr, &none), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_state_new("", &none), ASSAY_HOST_BAD_TEXT);
    EXPECT_EQ(none, nullptr);
    assay_host_state_free(nullptr);
    EXPECT_STREQ(assay_host_state_message(nullptr), "");
    EXPECT_EQ(assay_host_state_forget(nullptr), ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_state_set_choice(nullptr, ASSAY_HOST_OPENGL, ASSAY_HOST_CHOICE_AUTO),
              ASSAY_HOST_NULL_POINTER);
    auto choice = ASSAY_HOST_CHOICE_ABSENT;
    EXPECT_EQ(assay_host_state_get_choice(nullptr, ASSAY_HOST_OPENGL, &choice),
              ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(choice, ASSAY_HOST_CHOICE_AUTO);

    const StateFolder folder;
    const State state(folder.Get());
    const auto badInterface = MakeNumber<assay_host_interface>(2);
    EXPECT_EQ(assay_host_state_get_choice(state, ASSAY_HOST_OPENGL, nullptr),
              ASSAY_HOST_NULL_POINTER);
    EXPECT_EQ(assay_host_state_get_choice(state, badInterface, &choice), ASSAY_HOST_BAD_VALUE);
    EXPECT_EQ(assay_host_state_set_choice(state, badInterface, ASSAY_HOST_CHOICE_AUTO),
              ASSAY_HOST_BAD_VALUE);
    EXPECT_EQ(
        assay_host_state_set_choice(state, ASSAY_HOST_OPENGL, MakeNumber<assay_host_choice>(4)),
        ASSAY_HOST_BAD_VALUE);
    EXPECT_FALSE(folder.Exists());
}

} // namespace
