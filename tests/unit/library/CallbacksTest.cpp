// What the callbacks of a run are passed.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Runs.h"

namespace {

struct Tick {
    std::uint64_t fSteps = 0;
    std::string fNext;
    double fSeconds = 0;
};

TEST(LibraryCallbacks, ATickBringsTheStepsAndTheNextKey)
{
    Options options;
    Tick last;
    assay_host_options_on_tick(
        options,
        [](void* context, double seconds, std::uint64_t steps, const char* next) {
            *static_cast<Tick*>(context) = {steps, next, seconds};
            return *next == 'N' ? 1 : 0; // NumGLGPUs
        },
        &last);
    const ChildRun run({"out", "assayStart=\"x\"", "out", "QGFCoreInitialized=1", "out",
                        "QGFOGLInitialized=1", "out", "OGLContextCreated=1", "sleep", "600000"},
                       options);
    EXPECT_EQ(run.GetVerdict(), ASSAY_HOST_INTERRUPTED);
    EXPECT_EQ(last.fNext, "NumGLGPUs");
    EXPECT_EQ(last.fSteps, 6U) << "two of the start, the stamp and three checks";
    EXPECT_GT(last.fSeconds, 0);
    EXPECT_LE(last.fSeconds, assay_host_result_seconds(run.fResult));
}

TEST(LibraryCallbacks, LinesComeWithRisingTimesAndTheirContexts)
{
    struct Lines {
        std::size_t fExpected;
        const Lines* fOther;
        std::vector<std::string> fTexts;
        std::vector<double> fSeconds;

        bool IsWhole() const { return fTexts.size() == fExpected; }
    };
    // Ends the run when all lines have come: a line may come later than the end of the child.
    const auto take = [](void* context, const char* line, std::size_t size, double seconds) {
        auto& lines = *static_cast<Lines*>(context);
        lines.fTexts.emplace_back(line, size);
        lines.fSeconds.push_back(seconds);
        return lines.IsWhole() && lines.fOther->IsWhole() ? 1 : 0;
    };
    Options options;
    Lines out{2, nullptr, {}, {}};
    Lines err{1, &out, {}, {}};
    out.fOther = &err;
    EXPECT_EQ(assay_host_options_on_line(options, take, &out), ASSAY_HOST_OK);
    EXPECT_EQ(assay_host_options_on_error_line(options, take, &err), ASSAY_HOST_OK);
    const ChildRun run({"out", "a=1", "err", "e", "out", "b=2", "sleep", "600000"}, options);
    EXPECT_EQ(run.GetVerdict(), ASSAY_HOST_INTERRUPTED);
    EXPECT_THAT(out.fTexts, testing::ElementsAre("a=1", "b=2"));
    EXPECT_THAT(err.fTexts, testing::ElementsAre("e"));
    EXPECT_GT(out.fSeconds.at(0), 0);
    EXPECT_LE(out.fSeconds.at(0), out.fSeconds.at(1));
    EXPECT_GT(err.fSeconds.at(0), 0);
}

} // namespace
