#include "pmutil/PMLogging.h"

#include <cmath>
#include <cstdlib>
#include <functional>
#include <iomanip>
#include <memory>
#include <sstream>
#include <stdexcept>

#include <boost/date_time/posix_time/posix_time_types.hpp>
#include <boost/thread/barrier.hpp>
#include <boost/thread/thread.hpp>
#include <gmock/gmock.h>

#include "FreshProcess.h"
#include "RecordingLogger.h"
#include "pmutil/LogSinks.h"
#include "pmutil/System.h"
#include "pmutil/Threads.h"

namespace pmutil {
namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::IsEmpty;
using testing::SizeIs;

DebugValue gOn{"PMLoggingTest.on", 1};
DebugValue gOff{"PMLoggingTest.off", 0};
DebugValue gSwitched{"PMLoggingTest.switched", 0};

// Whether another thread can lock the mutex.
bool IsFree(boost::recursive_mutex& mutex)
{
    bool isFree = false;
    boost::thread other([&] {
        isFree = mutex.try_lock();
        if (isFree)
            mutex.unlock();
    });
    other.join();
    return isFree;
}

void Sleep(int milliseconds)
{
    boost::this_thread::sleep(boost::posix_time::milliseconds(milliseconds));
}

class PMLoggingTest : public testing::Test {
protected:
    void SetUp() override
    {
        InitLogging();
        GetDebugValue(gSwitched) = 0;
    }
};

TEST(PMLoggingDeathTest, StatementBeforeInitLoggingWritesNothing)
{
    ExpectInFreshProcess([] {
        RecordingLogger logger;
        GetDebugValue(gOff) = 1; // the overflow slot, which all values share before InitLogging
        REQUIRE_SO(GetDebugValue(gOn) == 1);
        REQUIRE_SO(!GetCurrentLogger());
        bool evaluated = false;
        PM_LOG(gOn, (evaluated = true));
        REQUIRE_SO(!evaluated);
        REQUIRE_SO(logger.lines.empty());
    });
}

TEST(PMLoggingDeathTest, LoggerMadeBeforeInitLoggingIsCurrentAfterwards)
{
    ExpectInFreshProcess([] {
        RecordingLogger first;
        RecordingLogger second;
        REQUIRE_SO(first.lines.empty()); // the change isn't logged before logging starts
        InitLogging();
        REQUIRE_SO(GetCurrentLogger().get() == &second);
    });
}

// During its construction it is on the stack without being a complete logger.
TEST(PMLoggingDeathTest, ThePMNullLoggerIsMadeUnderTheLogMutex)
{
    ExpectInFreshProcess([] {
        InitLogging();
        GetLogMutex().lock();
        boost::thread first([] { GetCurrentLogger(); });
        REQUIRE_SO(!first.timed_join(boost::posix_time::milliseconds(200)));
        REQUIRE_SO(!PMLogger::Top());
        GetLogMutex().unlock();
        first.join();
        REQUIRE_SO(PMLogger::Top()->GetName() == "PMNullLogger");
    });
}

TEST(PMLoggingDeathTest, FirstStatementsOfSeveralThreadsMeetAWholeLogger)
{
    ExpectInFreshProcess([] {
        InitLogging();
        constexpr unsigned kThreads = 8;
        boost::barrier start(kThreads);
        boost::thread_group threads;
        for (unsigned i = 0; i < kThreads; ++i)
            threads.create_thread([&start] {
                start.wait();
                const LoggerHolder logger = GetCurrentLogger();
                REQUIRE_SO(!logger->IsEnabledWrapper());
                PM_LOG(gOn, "text");
            });
        threads.join_all();
    });
}

TEST(PMLoggingDeathTest, EmptyStackMakesThePMNullLoggerOnce)
{
    ExpectInFreshProcess([] {
        InitLogging();
        bool evaluated = false;
        PM_LOG(gOn, (evaluated = true));
        REQUIRE_SO(!evaluated);
        const LoggerHolder holder = GetCurrentLogger();
        REQUIRE_SO(holder->GetName() == "PMNullLogger");
        REQUIRE_SO(dynamic_cast<PMNullLogger*>(holder.get()) != nullptr);
        REQUIRE_SO(GetCurrentLogger().get() == holder.get());
        {
            RecordingLogger logger;
            REQUIRE_SO(GetCurrentLogger().get() == &logger);
        }
        REQUIRE_SO(GetCurrentLogger().get() == holder.get());
    });
}

// Logs from a destructor that runs after the null logger's.
struct LateStatement {
    ~LateStatement()
    {
        PM_LOG(gOn, "late");
        std::fputs("survived", stderr);
    }
};

TEST(PMLoggingDeathTest, StatementDuringProcessExitIsHarmless)
{
    EXPECT_EXIT(
        {
            static LateStatement late;
            InitLogging();
            PM_LOG(gOn, "early");
            std::exit(0); // NOLINT(concurrency-mt-unsafe): the process has one thread
        },
        testing::ExitedWithCode(0), "^survived$");
}

TEST_F(PMLoggingTest, LineHasPrefixMessageAndLineEnd)
{
    RecordingLogger logger;
    PM_LOG(gOn, "count=" << 3 << ", ok");
    ASSERT_THAT(logger.lines, SizeIs(1));
    std::string form = logger.lines[0].substr(0, 43);
    for (std::size_t at = 5; at < 29 && at < form.size(); ++at)
        if (form[at] >= '0' && form[at] <= '9')
            form[at] = 'd';
    EXPECT_EQ(form, "00000.dddd.dd.dd_dd:dd:dd.ddd(+00.000)[tid=");
    EXPECT_EQ(MessageOf(logger.lines[0]), "count=3, ok\n");
    EXPECT_NE(logger.lines[0].find("(+00.000)[tid=" + GetCurrentThreadName() + "] "),
              std::string::npos);
}

TEST_F(PMLoggingTest, SecondLineIsNumberedAndTellsTheTimeSinceTheFirst)
{
    RecordingLogger logger;
    PM_LOG(gOn, "a");
    Sleep(30);
    PM_LOG(gOn, "b");
    ASSERT_THAT(logger.lines, SizeIs(2));
    EXPECT_EQ(logger.lines[1].substr(0, 6), "00001.");
    const auto plus = logger.lines[1].find("(+");
    ASSERT_NE(plus, std::string::npos);
    // The times of the lines, "10:49:36.366" of any day, are rounded to milliseconds.
    const auto getSeconds = [](const std::string& line) {
        const std::string time = line.substr(line.find('_') + 1);
        return (std::stod(time) * 60 + std::stod(time.substr(3))) * 60 + std::stod(time.substr(6));
    };
    constexpr double kDay = 24.0 * 60 * 60;
    const double passed =
        std::fmod(getSeconds(logger.lines[1]) - getSeconds(logger.lines[0]) + kDay, kDay);
    EXPECT_GT(passed, 0);
    EXPECT_NEAR(std::stod(logger.lines[1].substr(plus + 2)), passed, 0.002);
}

TEST_F(PMLoggingTest, LineIsThreePiecesAndOneFlush)
{
    struct Sink : RecordingLogger {
        void Flush() override { ++flushes; }
    } logger;
    PM_LOG(gOn, "text");
    ASSERT_THAT(logger.pieces, SizeIs(3));
    EXPECT_THAT(logger.pieces[0], EndsWith("] "));
    EXPECT_EQ(logger.pieces[1], "text");
    EXPECT_EQ(logger.pieces[2], "\n");
    EXPECT_EQ(logger.flushes, 1);
}

TEST_F(PMLoggingTest, MessageWithALineEndGetsNoSecondOne)
{
    RecordingLogger logger;
    PM_LOG(gOn, "text\n");
    PM_LOG(gOn, "text\r");
    ASSERT_THAT(logger.lines, SizeIs(2));
    EXPECT_EQ(MessageOf(logger.lines[0]), "text\n");
    EXPECT_EQ(MessageOf(logger.lines[1]), "text\r");
}

TEST_F(PMLoggingTest, EmptyMessageStillWritesPrefixAndLineEnd)
{
    RecordingLogger logger;
    PM_LOG(gOn, "");
    ASSERT_THAT(logger.lines, SizeIs(1));
    EXPECT_EQ(MessageOf(logger.lines[0]), "\n");
}

TEST_F(PMLoggingTest, EmptyPrefixAndMessageWriteTheLineEndAlone)
{
    struct Bare : RecordingLogger {
        std::string GetPrefix(const char*, int) override { return {}; }
        std::string GetLineEnd() override { return "\r\n"; }
    } logger;
    PM_LOG(gOn, "");
    EXPECT_THAT(logger.lines, ElementsAre("\r\n"));
}

TEST_F(PMLoggingTest, PrefixThatEndsInALineEndNeedsNoOther)
{
    struct Headed : RecordingLogger {
        std::string GetPrefix(const char*, int) override { return "head\n"; }
    } logger;
    PM_LOG(gOn, "");
    EXPECT_THAT(logger.lines, ElementsAre("head\n"));
}

TEST_F(PMLoggingTest, PercentSignsInAMessageAreText)
{
    RecordingLogger logger;
    PM_LOG(gOn, "100%s %n %d");
    ASSERT_THAT(logger.lines, SizeIs(1));
    EXPECT_EQ(MessageOf(logger.lines[0]), "100%s %n %d\n");
}

TEST_F(PMLoggingTest, LongMessageIsWhole)
{
    RecordingLogger logger;
    const std::string text(100000, 'x');
    PM_LOG(gOn, text);
    ASSERT_THAT(logger.lines, SizeIs(1));
    EXPECT_EQ(MessageOf(logger.lines[0]), text + "\n");
}

TEST_F(PMLoggingTest, StatementThatIsOffEvaluatesNothing)
{
    RecordingLogger logger;
    bool evaluated = false;
    PM_LOG(gOff, (evaluated = true));
    PM_LOG(gOff, (evaluated = true)); // with the name resolved
    EXPECT_FALSE(evaluated);
    EXPECT_THAT(logger.lines, IsEmpty());
}

TEST_F(PMLoggingTest, AnyValueButZeroTurnsAStatementOn)
{
    RecordingLogger logger;
    for (const int value : {0, 1, 0, 2, 0, -1}) {
        GetDebugValue(gSwitched) = value;
        PM_LOG(gSwitched, value);
    }
    ASSERT_THAT(logger.lines, SizeIs(3));
    EXPECT_EQ(MessageOf(logger.lines[0]), "1\n");
    EXPECT_EQ(MessageOf(logger.lines[1]), "2\n");
    EXPECT_EQ(MessageOf(logger.lines[2]), "-1\n");
}

TEST_F(PMLoggingTest, DisabledLoggerGetsNothingAndTheMessageIsNotAssembled)
{
    struct Disabled : RecordingLogger {
        bool IsEnabled(int level) override
        {
            levels.push_back(level);
            return false;
        }
        std::vector<int> levels;
    } logger;
    bool evaluated = false;
    PM_LOG(gOn, (evaluated = true));
    EXPECT_FALSE(evaluated);
    EXPECT_THAT(logger.lines, IsEmpty());
    EXPECT_THAT(logger.levels, ElementsAre(0));
}

TEST_F(PMLoggingTest, MessageIsAssembledUnderTheLogMutex)
{
    RecordingLogger logger;
    ASSERT_TRUE(IsFree(GetLogMutex()));
    PM_LOG(gOn, "free=" << IsFree(GetLogMutex()));
    ASSERT_THAT(logger.lines, SizeIs(1));
    EXPECT_EQ(MessageOf(logger.lines[0]), "free=0\n");
    EXPECT_TRUE(IsFree(GetLogMutex()));
}

TEST_F(PMLoggingTest, EnabledIsAskedUnderTheLogMutex)
{
    struct Asking : RecordingLogger {
        bool IsEnabled(int) override
        {
            wasFree = IsFree(GetLogMutex());
            return true;
        }
        bool wasFree = true;
    } logger;
    PM_LOG(gOn, "x");
    EXPECT_FALSE(logger.wasFree);
}

std::string Throwing()
{
    throw std::runtime_error("no text");
}

TEST_F(PMLoggingTest, MessageThatThrowsCostsItsLineOnly)
{
    RecordingLogger logger;
    EXPECT_NO_THROW(PM_LOG(gOn, "lost " << Throwing()));
    EXPECT_TRUE(IsFree(GetLogMutex()));
    PM_LOG(gOn, "next");
    ASSERT_THAT(logger.lines, SizeIs(1));
    EXPECT_EQ(MessageOf(logger.lines[0]), "next\n");
}

TEST_F(PMLoggingTest, EachMessageStartsWithDefaultFormatting)
{
    RecordingLogger logger;
    PM_LOG(gOn, std::hex << std::showbase << std::setprecision(2) << std::setfill('*') << 255 << " "
                         << 1.2345 << std::setw(9));
    PM_LOG(gOn, 255 << " " << 1.23456789 << std::setw(3) << 7);
    PM_LOG(gOn, "cut" << static_cast<std::streambuf*>(nullptr) << " short");
    PM_LOG(gOn, ""
                    << "whole"
                    << " again");
    ASSERT_THAT(logger.lines, SizeIs(4));
    EXPECT_EQ(MessageOf(logger.lines[0]), "0xff 1.2\n");
    EXPECT_EQ(MessageOf(logger.lines[1]), "255 1.23457  7\n");
    EXPECT_EQ(MessageOf(logger.lines[2]), "cut\n");
    EXPECT_EQ(MessageOf(logger.lines[3]), "whole again\n");
}

// What a statement does to its stream.
struct Change {
    std::function<void(std::ostream&)> fMake;
};

std::ostream& operator<<(std::ostream& out, const Change& change)
{
    change.fMake(out);
    return out;
}

class FlushCounter : public std::stringbuf {
public:
    int flushes = 0;

protected:
    int sync() override
    {
        ++flushes;
        return 0;
    }
};

TEST_F(PMLoggingTest, AStatementsStreamLeavesNothingToTheNext)
{
    RecordingLogger logger;
    FlushCounter counter;
    std::ostream other(&counter);
    const Change spoil = {[&other](std::ostream& out) {
        out.exceptions(std::ios::failbit);
        out.tie(&other);
    }};
    const Change fail = {[](std::ostream& out) { out.setstate(std::ios::failbit); }};
    PM_LOG(gOn, "one" << spoil);
    EXPECT_EQ(counter.flushes, 0);
    PM_LOG(gOn, "two" << fail);
    PM_LOG(gOn, "three");
    ASSERT_THAT(logger.lines, SizeIs(3));
    EXPECT_EQ(MessageOf(logger.lines[1]), "two\n");
    EXPECT_EQ(MessageOf(logger.lines[2]), "three\n");
    EXPECT_EQ(counter.flushes, 0);
}

// A character that is put into the stream by itself.
struct Put {
    char character;
};

std::ostream& operator<<(std::ostream& out, const Put& put)
{
    return out.put(put.character);
}

TEST_F(PMLoggingTest, AMessageMayBePutTogetherByCharacters)
{
    RecordingLogger logger;
    PM_LOG(gOn, "a" << Put{'b'} << Put{'\xFF'} << "c");
    ASSERT_THAT(logger.lines, SizeIs(1));
    EXPECT_EQ(MessageOf(logger.lines[0]), "ab\xFF"
                                          "c\n");
}

int LogAndGive(int value)
{
    PM_LOG(gOn, "inner " << std::hex << value);
    return value;
}

TEST_F(PMLoggingTest, MessageMayLogWhileItIsAssembled)
{
    RecordingLogger logger;
    PM_LOG(gOn, "outer " << LogAndGive(31) << " " << LogAndGive(32));
    ASSERT_THAT(logger.lines, SizeIs(3));
    EXPECT_EQ(MessageOf(logger.lines[0]), "inner 1f\n");
    EXPECT_EQ(MessageOf(logger.lines[1]), "inner 20\n");
    EXPECT_EQ(MessageOf(logger.lines[2]), "outer 31 32\n");
}

TEST_F(PMLoggingTest, SinkThatThrowsDoesNotReachTheProgram)
{
    struct Failing : RecordingLogger {
        void Write(const char*, std::size_t) override { throw 1; }
    } logger;
    EXPECT_NO_THROW(PM_LOG(gOn, "x"));
    EXPECT_TRUE(IsFree(GetLogMutex()));
    EXPECT_THROW(logger.LogPrintf(nullptr, 0, "x"), int);
    EXPECT_TRUE(IsFree(GetLogMutex()));
}

TEST_F(PMLoggingTest, SinkMayLog)
{
    struct Chatty : RecordingLogger {
        void Flush() override
        {
            RecordingLogger::Flush();
            if (flushes == 1)
                PM_LOG(gOn, "inner");
        }
    } logger;
    PM_LOG(gOn, "outer");
    ASSERT_THAT(logger.lines, SizeIs(2));
    EXPECT_EQ(MessageOf(logger.lines[0]), "outer\n");
    EXPECT_EQ(MessageOf(logger.lines[1]), "inner\n");
}

TEST_F(PMLoggingTest, NewLoggerIsToldToTheOneItReplaces)
{
    RecordingLogger first("first");
    PM_LOG(gOn, "to first");
    {
        RecordingLogger second("second");
        PM_LOG(gOn, "to second");
        ASSERT_THAT(second.lines, SizeIs(1));
        EXPECT_EQ(MessageOf(second.lines[0]), "to second\n");
        EXPECT_EQ(second.lines[0].substr(0, 6), "00000.");
    }
    PM_LOG(gOn, "first again");
    ASSERT_THAT(first.lines, SizeIs(3));
    EXPECT_EQ(MessageOf(first.lines[0]), "to first\n");
    EXPECT_EQ(MessageOf(first.lines[1]), "Activating new logger second\n");
    EXPECT_EQ(MessageOf(first.lines[2]), "first again\n");
}

TEST_F(PMLoggingTest, FailureToTellOfANewLoggerDoesNotReachIt)
{
    struct Broken : RecordingLogger {
        void Write(const char*, std::size_t) override
        {
            ++failures;
            throw std::runtime_error("disk full");
        }
        int failures = 0;
    } broken;
    RecordingLogger next("next");
    EXPECT_EQ(broken.failures, 1);
    PM_LOG(gOn, "line");
    ASSERT_THAT(next.lines, SizeIs(1));
    EXPECT_EQ(MessageOf(next.lines[0]), "line\n");
}

TEST_F(PMLoggingTest, StackMutexIsFreeWhileALineIsWritten)
{
    struct Asking : RecordingLogger {
        void Write(const char*, std::size_t) override { stackWasFree = IsFree(Mutex()); }
        bool stackWasFree = false;
    } first;
    const RecordingLogger second; // makes the first one log from a constructor
    EXPECT_TRUE(first.stackWasFree);
}

TEST_F(PMLoggingTest, LoggerThatDiesOutOfTurnLeavesTheStackInOrder)
{
    RecordingLogger bottom("bottom");
    auto middle = std::make_unique<RecordingLogger>("middle");
    RecordingLogger top("top");
    EXPECT_EQ(PMLogger::Below(&top), middle.get());
    middle.reset();
    EXPECT_EQ(GetCurrentLogger().get(), &top);
    EXPECT_EQ(PMLogger::Below(&top), &bottom);
}

TEST_F(PMLoggingTest, BaseNameIsTheTextBehindTheLastSeparatorWithSomethingBehindIt)
{
    RecordingLogger logger;
    const struct {
        const char* path;
        const char* base;
    } kCases[] = {
        {nullptr, ""},
        {"", ""},
        {"file.cpp", "file.cpp"},
        {"a/b/c.cpp", "c.cpp"},
        {"a\\b\\c.cpp", "c.cpp"},
        {"a/b\\c.cpp", "c.cpp"},
        {"a/b/", "b/"},
        {"a\\b\\", "b\\"},
        {"/", "/"},
        {"/x", "x"},
        {"a//", "/"},
    };
    for (const auto& test : kCases)
        EXPECT_EQ(logger.GetBaseName(test.path), test.base)
            << (test.path != nullptr ? test.path : "null");
}

// A sink that overrides only the pure operations.
struct Plain : PMLogger {
    Plain() : PMLogger("plain") {}
    void Write(const char* data, std::size_t size) override { text.append(data, size); }
    std::string text;
};

TEST_F(PMLoggingTest, DefaultsOfTheBase)
{
    Plain logger;
    EXPECT_TRUE(logger.IsEnabled(0));
    EXPECT_TRUE(logger.IsEnabled(17));
    EXPECT_EQ(logger.GetSuffix(), "");
    EXPECT_EQ(logger.GetLineEnd(), "\n");
    EXPECT_EQ(logger.GetName(), "plain");
    logger.Flush();
    EXPECT_EQ(logger.text, "");
}

TEST_F(PMLoggingTest, WrappersForward)
{
    Plain logger;
    EXPECT_TRUE(logger.IsEnabledWrapper());
    EXPECT_EQ(logger.WriteLineEnd(), "\n");
    EXPECT_EQ(logger.text, "");
    logger.WriteText("abc", 2);
    EXPECT_EQ(logger.text, "ab");
    logger.text.clear();
    logger.LogPrintf("file", 1, "%d-%s", 5, "x");
    EXPECT_EQ(MessageOf(logger.text), "5-x\n");
}

TEST_F(PMLoggingTest, LogPassesThePlaceToThePrefix)
{
    struct Placed : RecordingLogger {
        std::string GetPrefix(const char* file, int line) override
        {
            return std::string(file) + ":" + std::to_string(line) + " ";
        }
    } logger;
    logger.LogPrintf("dir/f.cpp", 12, "x");
    const int line = __LINE__ + 1;
    PM_LOG(gOn, "y");
    ASSERT_THAT(logger.lines, SizeIs(2));
    EXPECT_EQ(logger.lines[0], "dir/f.cpp:12 x\n");
    EXPECT_EQ(logger.lines[1], __FILE__ ":" + std::to_string(line) + " y\n");
}

TEST_F(PMLoggingTest, ScopeLogsBeginAndEndWithItsDuration)
{
    RecordingLogger logger;
    {
        const PMLogScope scope("probe %s", "file", 3);
        Sleep(30);
    }
    ASSERT_THAT(logger.lines, SizeIs(2));
    EXPECT_EQ(MessageOf(logger.lines[0]), "BEGIN probe %s\n");
    const std::string end = MessageOf(logger.lines[1]);
    const std::string head = "END probe %s, duration=";
    ASSERT_EQ(end.substr(0, head.size()), head);
    std::istringstream rest(end.substr(head.size()));
    double duration = 0;
    ASSERT_TRUE(rest >> duration);
    EXPECT_GE(duration, 0.025);
    std::ostringstream again;
    again << duration;
    EXPECT_EQ(end, head + again.str() + "\n"); // a stream's default formatting
}

TEST_F(PMLoggingTest, ScopeDurationLeavesOutItsFirstLine)
{
    struct Slow : RecordingLogger {
        void Flush() override
        {
            if (flushes == 0) {
                Sleep(200);
                fEndOfFirst = GetClockSeconds();
            }
            RecordingLogger::Flush();
        }
        double fEndOfFirst = 0;
    } logger;
    {
        const PMLogScope scope("s", nullptr, 0);
    }
    const double sinceFirst = GetClockSeconds() - logger.fEndOfFirst;
    ASSERT_THAT(logger.lines, SizeIs(2));
    const std::string end = MessageOf(logger.lines[1]);
    EXPECT_LE(std::stod(end.substr(end.find('=') + 1)), sinceFirst + 1e-3) << end;
}

TEST_F(PMLoggingTest, ScopeWritesNothingToADisabledLogger)
{
    struct Switch : RecordingLogger {
        bool IsEnabled(int) override { return enabled; }
        bool enabled = false;
    } logger;
    {
        const PMLogScope scope("s", nullptr, 0);
        EXPECT_THAT(logger.lines, IsEmpty());
        logger.enabled = true; // the end checks it again
    }
    ASSERT_THAT(logger.lines, SizeIs(1));
    EXPECT_THAT(MessageOf(logger.lines[0]), testing::StartsWith("END s, duration="));
}

TEST_F(PMLoggingTest, LogTimeCountsNestedCallsOnce)
{
    struct Slow : RecordingLogger {
        void Flush() override
        {
            RecordingLogger::Flush();
            Sleep(20);
            if (flushes < 3)
                LogPrintf(nullptr, 0, "nested");
        }
    } logger;
    const double before = GetLogTime();
    const double start = GetClockSeconds();
    logger.LogPrintf(nullptr, 0, "x");
    const double elapsed = GetClockSeconds() - start;
    const double logged = GetLogTime() - before;
    EXPECT_GE(logged, 0.055);
    EXPECT_LE(logged, elapsed + 1e-6);
}

TEST_F(PMLoggingTest, TimeOutsideLoggingIsNotLogTime)
{
    RecordingLogger logger;
    const double before = GetLogTime();
    Sleep(50);
    EXPECT_EQ(GetLogTime(), before);
    const double start = GetClockSeconds();
    EXPECT_TRUE(logger.IsEnabledWrapper());
    EXPECT_LE(GetLogTime() - before, GetClockSeconds() - start + 1e-6);
}

TEST_F(PMLoggingTest, ThreadsLogWholeLinesNumberedWithoutGaps)
{
    constexpr int kThreads = 4;
    constexpr int kLines = 200;
    RecordingLogger logger;
    boost::thread_group threads;
    for (int thread = 0; thread < kThreads; ++thread)
        threads.create_thread([thread] {
            for (int line = 0; line < kLines; ++line)
                PM_LOG(gOn, "thread" << thread << " line" << line);
        });
    threads.join_all();
    ASSERT_THAT(logger.lines, SizeIs(kThreads * kLines));
    std::vector<int> next(kThreads);
    for (std::size_t number = 0; number < logger.lines.size(); ++number) {
        const std::string& line = logger.lines[number];
        EXPECT_EQ(std::stoul(line.substr(0, 5)), number);
        int thread = -1;
        int count = -1;
        ASSERT_EQ(std::sscanf(MessageOf(line).c_str(), "thread%d line%d\n", &thread, &count), 2)
            << line;
        EXPECT_EQ(count, next.at(static_cast<std::size_t>(thread))++);
        EXPECT_EQ(line.back(), '\n');
    }
}

TEST_F(PMLoggingTest, InitLoggingASecondTimeKeepsValues)
{
    GetDebugValue(gSwitched) = 7;
    InitLogging();
    EXPECT_EQ(GetDebugValue(gSwitched), 7);
}

TEST_F(PMLoggingTest, IndentWritesOneBlankFewerThanItsDepth)
{
    const auto text = [] {
        std::ostringstream out;
        out << gLogIndent;
        return out.str();
    };
    EXPECT_EQ(text(), "");
    gLogIndent.Increment();
    EXPECT_EQ(text(), "");
    gLogIndent.Increment();
    gLogIndent.Increment();
    EXPECT_EQ(text(), "  ");
    for (int i = 0; i < 3; ++i)
        gLogIndent.Decrement();
    EXPECT_EQ(text(), "");
}

} // namespace
} // namespace pmutil
