// Log scopes, and lines when loggers, threads and locales change in between.
#include <locale>
#include <stdexcept>

#include <boost/thread/thread.hpp>
#include <gtest/gtest.h>

#include "RecordingLogger.h"
#include "pmutil/System.h"

namespace pmutil {
namespace {

DebugValue gOn{"LogScopeTest.on", 1};

class LogScope : public testing::Test {
protected:
    LogScope() { InitLogging(); }

    // The messages without line ends and durations.
    static std::vector<std::string> Messages(const RecordingLogger& logger)
    {
        std::vector<std::string> messages;
        for (const std::string& line : logger.lines) {
            const std::string message = MessageOf(line);
            const auto duration = message.find(", duration=");
            messages.push_back(message.substr(0, duration == std::string::npos ? message.size() - 1
                                                                               : duration + 11));
        }
        return messages;
    }
};

using Lines = std::vector<std::string>;

TEST_F(LogScope, ScopesNest)
{
    RecordingLogger logger;
    {
        const PMLogScope outer("outer", "file", 1);
        const PMLogScope inner("inner", "file", 2);
    }
    EXPECT_EQ(Messages(logger), (Lines{"BEGIN outer", "BEGIN inner",
                                       "END inner, duration=", "END outer, duration="}));
}

TEST_F(LogScope, AnExceptionEndsTheScopesThatItLeaves)
{
    RecordingLogger logger;
    try {
        const PMLogScope outer("outer", "file", 1);
        const PMLogScope inner("inner", "file", 2);
        throw std::runtime_error("left");
    } catch (const std::runtime_error&) {
        PM_LOG(gOn, "caught");
    }
    EXPECT_EQ(Messages(logger), (Lines{"BEGIN outer", "BEGIN inner",
                                       "END inner, duration=", "END outer, duration=", "caught"}));
}

TEST_F(LogScope, TheEndGoesToTheLoggerOfThatMoment)
{
    RecordingLogger first("first");
    auto scope = std::make_unique<PMLogScope>("scope", "file", 1);
    {
        RecordingLogger second("second");
        scope.reset();
        EXPECT_EQ(Messages(second), Lines{"END scope, duration="});
    }
    EXPECT_EQ(Messages(first), (Lines{"BEGIN scope", "Activating new logger second"}));
}

TEST_F(LogScope, ADisabledLoggerIsToldOfItsSuccessorToo)
{
    struct Disabled : RecordingLogger {
        bool IsEnabled(int) override { return false; }
    } disabled;
    const RecordingLogger next("next");
    EXPECT_EQ(Messages(disabled), Lines{"Activating new logger next"});
}

// The time of day on a line in seconds, and its delta.
struct Times {
    explicit Times(const std::string& line)
    {
        EXPECT_EQ(std::sscanf(line.c_str(), "%*5d.%*4d.%*2d.%*2d_%d:%d:%lf(+%lf)", &hour, &minute,
                              &second, &delta),
                  4)
            << line;
    }
    double OfDay() const { return (hour * 60 + minute) * 60 + second; }

    int hour = 0;
    int minute = 0;
    double second = 0;
    double delta = 0;
};

TEST_F(LogScope, EachLineTellsTheTimeSinceTheOneBefore)
{
    RecordingLogger logger;
    for (int line = 0; line < 4; ++line) {
        PM_LOG(gOn, "line");
        const double start = GetClockSeconds();
        while (GetClockSeconds() - start < 0.02) {
        }
    }
    ASSERT_EQ(logger.lines.size(), 4U);
    for (std::size_t line = 1; line < 4; ++line) {
        const Times before(logger.lines[line - 1]);
        const Times now(logger.lines[line]);
        double passed = now.OfDay() - before.OfDay();
        if (passed < 0)
            passed += 24.0 * 60 * 60; // midnight has passed
        EXPECT_NEAR(now.delta, passed, 0.0025) << logger.lines[line];
    }
}

TEST_F(LogScope, TimeInLoggingIsCountedOnceForThreadsThatLogTogether)
{
    struct Sink : RecordingLogger {
        void Write(const char*, std::size_t) override
        {
            boost::thread([this] {
                IsEnabledWrapper();
                timeAfter = GetLogTime();
            }).join();
        }
        bool IsEnabled(int) override
        {
            const double start = GetClockSeconds();
            while (GetClockSeconds() == start) {
            }
            return true;
        }
        double timeAfter = 0;
    } logger;
    const double before = GetLogTime();
    logger.WriteText("x", 1);
    EXPECT_EQ(logger.timeAfter, before) << "of the call within another's";
    EXPECT_GT(GetLogTime(), before);
}

TEST_F(LogScope, AMessageFollowsTheGlobalLocaleOfItsMoment)
{
    struct Grouping : std::numpunct<char> {
        char do_thousands_sep() const override { return '\''; }
        std::string do_grouping() const override { return "\3"; }
        char do_decimal_point() const override { return ','; }
    };
    RecordingLogger logger;
    PM_LOG(gOn, 1234567 << " " << 0.5);
    const std::locale before = std::locale::global(std::locale(std::locale(), new Grouping));
    PM_LOG(gOn, 1234567 << " " << 0.5);
    std::locale::global(before);
    PM_LOG(gOn, 1234567 << " " << 0.5);
    EXPECT_EQ(Messages(logger), (Lines{"1234567 0.5", "1'234'567 0,5", "1234567 0.5"}));
}

} // namespace
} // namespace pmutil
