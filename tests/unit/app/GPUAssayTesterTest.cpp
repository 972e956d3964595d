#include "GPUAssayTester.h"

#include <ctime>
#include <limits>
#include <regex>
#include <stdexcept>

#include <gmock/gmock.h>

#include "AppFixtures.h"
#include "GPUTest.h"
#include "Timestamp.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "support/CapturedLog.h"

namespace assay {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

// The text of the exception that a step throws; empty for none.
std::string StepFailure(GPUAssayTester& tester)
{
    try {
        tester.Step();
    } catch (const std::runtime_error& exception) {
        return exception.what();
    }
    return "";
}

TEST(Step, InitialValues)
{
    TestApp app;
    GPUAssayTester tester(&app);
    EXPECT_EQ(tester.fCrashAfter, 0xFFFFFFFFU);
    EXPECT_EQ(tester.fThrowAfter, -1);
    EXPECT_EQ(tester.fStep, 0U);
    EXPECT_EQ(tester.fFailures, 0);
    EXPECT_FALSE(tester.fOCLAvailable);
    for (int i = 0; i < 100; ++i)
        tester.Step();
    EXPECT_EQ(tester.fStep, 100U);
}

TEST(Step, CrashesAtEveryStepFromTheThresholdOn)
{
    TestApp app;
    GPUAssayTester tester(&app);
    tester.fCrashAfter = 2;
    EXPECT_EQ(StepFailure(tester), "");
    EXPECT_EQ(StepFailure(tester), "");
    EXPECT_EQ(StepFailure(tester), "programmed failure");
    EXPECT_EQ(StepFailure(tester), "programmed failure");
    EXPECT_EQ(tester.fStep, 4U);
}

TEST(Step, ThrowsAtExactlyOneStep)
{
    TestApp app;
    GPUAssayTester tester(&app);
    tester.fThrowAfter = 1;
    EXPECT_EQ(StepFailure(tester), "");
    EXPECT_EQ(StepFailure(tester), "Programmed throw");
    EXPECT_EQ(StepFailure(tester), "");
}

TEST(Step, TheCrashPrecedesTheThrow)
{
    TestApp app;
    GPUAssayTester tester(&app);
    tester.fCrashAfter = 0;
    tester.fThrowAfter = 0;
    EXPECT_EQ(StepFailure(tester), "programmed failure");
}

TEST(Step, TheThresholdIsComparedUnsigned)
{
    TestApp app;
    GPUAssayTester tester(&app);
    tester.fCrashAfter = 0x80000000U;
    tester.fStep = 0x7FFFFFFFU;
    EXPECT_EQ(StepFailure(tester), "");
    EXPECT_EQ(StepFailure(tester), "programmed failure");
    tester.fCrashAfter = 0xFFFFFFFFU;
    tester.fThrowAfter = std::numeric_limits<std::int32_t>::min();
    tester.fStep = 0x80000000U;
    EXPECT_EQ(StepFailure(tester), "Programmed throw");
}

// A Crash that returns.
class SurvivingTester : public GPUAssayTester {
public:
    using GPUAssayTester::GPUAssayTester;
    void Crash() override { ++crashes; }
    int crashes = 0;
};

TEST(Step, ACrashThatReturnsIsFollowedByTheBaseCrash)
{
    TestApp app;
    SurvivingTester tester(&app);
    tester.fCrashAfter = 0;
    EXPECT_EQ(StepFailure(tester), "programmed failure");
    EXPECT_EQ(tester.crashes, 1);
}

TEST(Step, ACrashMayThrowSomethingElse)
{
    class OtherCrash : public GPUAssayTester {
    public:
        using GPUAssayTester::GPUAssayTester;
        void Crash() override { throw std::runtime_error("other"); }
    };
    TestApp app;
    OtherCrash tester(&app);
    tester.fCrashAfter = 0;
    EXPECT_EQ(StepFailure(tester), "other");
}

// Counts the steps that go through the virtual operation.
template <typename Base>
class StepCounter : public FakeTester<Base> {
public:
    using FakeTester<Base>::FakeTester;
    void Step() override { ++virtualSteps; }
    int virtualSteps = 0;
};

TEST(Step, OnlyTheLastStepOfARunIsVirtual)
{
    TestApp app;
    StepCounter<GPUAssayTester> plain(&app, FakeMachine(1, 1));
    plain.Run();
    EXPECT_EQ(plain.virtualSteps, 1);
    EXPECT_EQ(plain.fStep, 1U + 4 + 1 + 15 + 1 + 11 + 1);

    StepCounter<PixmereTester> pixmere(&app, FakeMachine(1, 1));
    pixmere.Run();
    EXPECT_EQ(pixmere.virtualSteps, 1);
    EXPECT_EQ(pixmere.fStep, 2U + 4 + 1 + 15 + 20 + 1 + 12 + 1);
}

TEST(Timestamp, IsLocalTimeZeroFilled)
{
    std::tm parts{};
    parts.tm_year = 2009 - 1900;
    parts.tm_mon = 1 - 1;
    parts.tm_mday = 2;
    parts.tm_hour = 3;
    parts.tm_min = 4;
    parts.tm_sec = 5;
    parts.tm_isdst = -1;
    EXPECT_EQ(LocalTimeText(std::mktime(&parts)), "2009-01-02_03:04:05");
    parts = {};
    parts.tm_year = 2031 - 1900;
    parts.tm_mon = 12 - 1;
    parts.tm_mday = 31;
    parts.tm_hour = 23;
    parts.tm_min = 59;
    parts.tm_sec = 58;
    parts.tm_isdst = -1;
    EXPECT_EQ(LocalTimeText(std::mktime(&parts)), "2031-12-31_23:59:58");
}

TEST(Timestamp, ThrowsForATimeOutOfRange)
{
    try {
        LocalTimeText(std::numeric_limits<std::time_t>::max());
        FAIL() << "no exception";
    } catch (const std::runtime_error& exception) {
        EXPECT_STREQ(exception.what(), "could not convert calendar time to local time");
    }
}

TEST(Timestamp, TheTestersIsTheTimeNow)
{
    TestApp app;
    GPUAssayTester tester(&app);
    const std::string before = LocalTimeText(std::time(nullptr));
    const std::string stamp = tester.GetTimestamp();
    const std::string after = LocalTimeText(std::time(nullptr));
    EXPECT_TRUE(std::regex_match(stamp, std::regex(R"(\d{4}-\d\d-\d\d_\d\d:\d\d:\d\d)"))) << stamp;
    EXPECT_LE(before, stamp);
    EXPECT_LE(stamp, after);
}

TEST(Timestamp, ItsLineTakesAStep)
{
    TestApp app;
    FakeTester<GPUAssayTester> tester(&app, {});
    tester.DoRunTimestamp("someKey");
    EXPECT_THAT(app.out, ElementsAre("someKey=\"2031-02-03_04:05:06\""));
    EXPECT_EQ(tester.fStep, 1U);
}

TEST(Timestamp, ItsLinePrecedesItsStep)
{
    TestApp app;
    FakeTester<GPUAssayTester> tester(&app, {});
    tester.fThrowAfter = 0;
    EXPECT_THROW(tester.DoRunTimestamp("someKey"), std::runtime_error);
    EXPECT_THAT(app.out, ElementsAre("someKey=\"2031-02-03_04:05:06\""));
}

// A test that calls a function.
class CallTest : public GPUTest {
public:
    explicit CallTest(std::function<void(const GPUEntry&)> call) : fCall(std::move(call)) {}
    void Run(GPUAssayTester&, const GPUEntry& entry) const override { fCall(entry); }

private:
    std::function<void(const GPUEntry&)> fCall;
};

class RunTestTest : public testing::Test {
protected:
    RunTestTest()
    {
        for (const char* tag : {"a", "b", "c"})
            entries.push_back({tag, MakeGL(boost::make_shared<FakeGPUImpl>())});
    }
    Lines Tags() const
    {
        Lines tags;
        for (const GPUEntry& entry : entries)
            tags.push_back(entry.tag);
        return tags;
    }
    // Makes the test of the entry with that tag throw.
    template <typename Exception>
    void FailAt(const std::string& failing, const Exception& exception)
    {
        tester.RunTest(entries, CallTest([&](const GPUEntry& entry) {
                           seen.push_back(entry.tag);
                           if (entry.tag == failing)
                               throw exception;
                       }));
    }

    TestApp app;
    GPUAssayTester tester{&app};
    GPUEntries entries;
    Lines seen;
    CapturedStderr err;
};

struct NullLogical : QGF::LogicalException {
    NullLogical() : QGF::LogicalException("") {}
    const char* message() const noexcept override { return nullptr; }
};
struct NullStandard : std::exception {
    const char* what() const noexcept override { return nullptr; }
};

TEST_F(RunTestTest, WalksTheListInOrder)
{
    FailAt("none", 0);
    EXPECT_THAT(seen, ElementsAre("a", "b", "c"));
    EXPECT_THAT(Tags(), ElementsAre("a", "b", "c"));
    EXPECT_EQ(tester.fFailures, 0);
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(RunTestTest, RemovesAFailedEntryAndContinues)
{
    FailAt("b", std::runtime_error("bad"));
    EXPECT_THAT(seen, ElementsAre("a", "b", "c"));
    EXPECT_THAT(Tags(), ElementsAre("a", "c"));
    EXPECT_EQ(tester.fFailures, 1);
    EXPECT_THAT(err.Take(), ElementsAre("exception: bad"));
    EXPECT_EQ(tester.fStep, 0U);
}

TEST_F(RunTestTest, TheFirstAndTheLastMayFail)
{
    FailAt("a", std::runtime_error("bad"));
    FailAt("c", std::runtime_error("worse"));
    EXPECT_THAT(Tags(), ElementsAre("b"));
    EXPECT_EQ(tester.fFailures, 2);
    EXPECT_THAT(err.Take(), ElementsAre("exception: bad", "exception: worse"));
}

TEST_F(RunTestTest, ReportsEachKindOfException)
{
    FailAt("a", QGF::LogicalException("no context"));
    FailAt("b", QGF::InternalException("f", 1, "x"));
    FailAt("c", 5);
    EXPECT_THAT(err.Take(), ElementsAre("QGF::LogicalException: no context", "exception: f(1): x",
                                        "unknown exception"));
    EXPECT_EQ(tester.fFailures, 3);
    EXPECT_THAT(Tags(), IsEmpty());
}

TEST_F(RunTestTest, PrintsANullText)
{
    FailAt("a", NullLogical());
    FailAt("b", NullStandard());
    EXPECT_THAT(err.Take(), ElementsAre("QGF::LogicalException: <NULL>", "exception: <NULL>"));
}

TEST_F(RunTestTest, DoesNotCallStderr)
{
    class Muted : public TestApp {
    public:
        void DoStderr(const std::string&) override { ++lines; }
        int lines = 0;
    };
    Muted muted;
    GPUAssayTester other(&muted);
    other.RunTest(entries, CallTest([](const GPUEntry&) { throw std::runtime_error("bad"); }));
    EXPECT_EQ(muted.lines, 0);
    EXPECT_THAT(err.Take(), ElementsAre("exception: bad", "exception: bad", "exception: bad"));
}

TEST_F(RunTestTest, IgnoresAFailedStandardError)
{
    struct Broken : std::streambuf {
    } broken;
    {
        const RedirectStream redirect(std::cerr, &broken);
        FailAt("a", std::runtime_error("lost"));
    }
    FailAt("b", std::runtime_error("reported"));
    EXPECT_THAT(err.Take(), ElementsAre("exception: reported"));
    EXPECT_EQ(tester.fFailures, 2);
}

TEST_F(RunTestTest, AWrongTypeOfDeviceIsAFailure)
{
    entries.clear();
    entries.push_back({"cl", MakeCL(boost::make_shared<FakeGPUImpl>())});
    tester.RunTest(entries,
                   TestFunc<GPUAssayTester, pmutil::GLGPU>(&GPUAssayTester::DoRunGLVersion));
    EXPECT_THAT(err.Take(), ElementsAre("exception: std::bad_cast"));
    EXPECT_THAT(entries, IsEmpty());
    EXPECT_THAT(app.out, IsEmpty());
}

TEST_F(RunTestTest, ReleasesAFailedDevice)
{
    const FakeGPU gpu = boost::make_shared<FakeGPUImpl>();
    entries.clear();
    entries.push_back({"a", MakeGL(gpu)});
    EXPECT_EQ(gpu.use_count(), 2);
    FailAt("a", std::runtime_error("bad"));
    EXPECT_EQ(gpu.use_count(), 1);
}

TEST_F(RunTestTest, LogsATerminatedDeviceWhenVerbose)
{
    assay_test::CapturedLog log(pmutil::gGPUAssay);
    log.SetOn(false);
    FailAt("a", std::runtime_error("bad"));
    EXPECT_EQ(log.Text(), "");
    log.SetOn(true);
    FailAt("b", std::runtime_error("bad"));
    EXPECT_EQ(log.Text(), "Testing terminated for b\n");
}

TEST(Sequence, CallsItsOperationsInOrder)
{
    class Tester : public GPUAssayTester {
    public:
        using GPUAssayTester::GPUAssayTester;
        void DoRunStart() override { calls.emplace_back("Start"); }
        void DoRunQGFCoreInitialize() override { calls.emplace_back("Core"); }
        void DoRunQGFOGLInitialize() override { calls.emplace_back("OGL"); }
        void DoRunOGLContextCreate() override { calls.emplace_back("Context"); }
        void DoRunGLEnumerate() override { calls.emplace_back("GLEnumerate"); }
        void DoRunGLTests() override { calls.emplace_back("GLTests"); }
        void DoRunQGFOCLInitialize() override
        {
            calls.emplace_back("OCL");
            fOCLAvailable = available;
        }
        void DoRunCLEnumerate() override { calls.emplace_back("CLEnumerate"); }
        void DoRunCLTests() override { calls.emplace_back("CLTests"); }
        void DoRunTimestamp(const std::string& key) override { calls.push_back(key); }
        void Step() override { calls.emplace_back("Step"); }
        bool available = false;
        Lines calls;
    };
    TestApp app;
    Tester without(&app);
    without.fStep = 99;
    without.Run();
    EXPECT_EQ(without.fStep, 0U);
    EXPECT_THAT(without.calls, ElementsAre("Start", "assayStart", "Core", "OGL", "Context",
                                           "GLEnumerate", "GLTests", "OCL", "assayEnd", "Step"));
    Tester with(&app);
    with.available = true;
    with.Run();
    EXPECT_THAT(with.calls,
                ElementsAre("Start", "assayStart", "Core", "OGL", "Context", "GLEnumerate",
                            "GLTests", "OCL", "CLEnumerate", "CLTests", "assayEnd", "Step"));
}

TEST(Sequence, RunTestIsReachedVirtually)
{
    class Tester : public FakeTester<PixmereTester> {
    public:
        using FakeTester<PixmereTester>::FakeTester;
        void RunTest(GPUEntries& entries, const GPUTest& test) override
        {
            ++calls;
            FakeTester<PixmereTester>::RunTest(entries, test);
        }
        int calls = 0;
    };
    TestApp app;
    Tester tester(&app, FakeMachine(1, 1));
    tester.Run();
    EXPECT_EQ(tester.calls, 15 + 21 + 11 + 1);
}

TEST(Sequence, AnEmptyMachineHasAShortReport)
{
    const CapturedStderr err;
    MachineApp<GPUAssayTester> app(FakeMachine(0, 0, false));
    EXPECT_EQ(app.RunWith({}), 0);
    EXPECT_THAT(app.out, ElementsAre("assayStart=\"2031-02-03_04:05:06\"", "QGFCoreInitialized=1",
                                     "QGFOGLInitialized=1", "OGLContextCreated=1", "NumGLGPUs=0",
                                     "assayEnd=\"2031-02-03_04:05:06\""));
    EXPECT_EQ(app.GetTester()->fStep, 8U); // the start, the six lines and the last one
}

} // namespace
} // namespace assay
