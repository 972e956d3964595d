#include "GPUAssayApp.h"

#include <cstdio>
#include <exception>
#include <limits>
#include <type_traits>

#include <gmock/gmock.h>

#include "AppFixtures.h"
#include "PixmereAssay.h"
#include "RunToStatus.h"
#include "pmutil/LogSinks.h"
#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplHardware.h"

namespace assay {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

const Lines kUsage = {"usage: ", "    -help {show this message}",
                      "    -crashAfter=N {GPUAssayTester should crash after N steps}",
                      "    -throwAfter=N {GPUAssayTester should throw after N steps}",
                      "    -app=SomeApp {specify name of host app}",
                      "    -stdout=line_of_stdout {puts the line to stdout as-is}",
                      "    -stderr=line_of_stderr {puts the line to stderr as-is}",
                      "    -exit=N {app should exit with N}", "    -verbose=N {verbosity level}",
                      // NOLINTNEXTLINE(bugprone-suspicious-missing-comma): one line of the text
                      "    -timeout=N {Mac only, SIGALRM kills assay after N seconds, if not "
                      "finished}",
                      "    -comment=line_of_comment {outputs '# line_of_comment'}",
                      "    -hang=N {before exit, sleep for N milliseconds}"};

// A tester whose sequence is a single call.
class OneCallTester : public GPUAssayTester {
public:
    OneCallTester(GPUAssayApp* app, std::function<void(GPUAssayTester&)> call)
        : GPUAssayTester(app), fCall(std::move(call))
    {}
    // The first operation of the sequence; an exception ends the run.
    void DoRunStart() override { fCall(*this); }
    void DoRunQGFCoreInitialize() override {}
    void DoRunQGFOGLInitialize() override {}
    void DoRunOGLContextCreate() override {}
    void DoRunGLEnumerate() override {}
    void DoRunQGFOCLInitialize() override {}
    std::string GetTimestamp() override { return "now"; }

private:
    std::function<void(GPUAssayTester&)> fCall;
};

class AppRun : public testing::Test {
protected:
    void TearDown() override { pmutil::GetDebugValue(pmutil::gGPUAssay) = 0; }

    // Makes the sequence call `call`.
    void InSequence(const std::function<void(GPUAssayTester&)>& call)
    {
        app.makeTester = [call](GPUAssayApp* owner) { return new OneCallTester(owner, call); };
    }

    CapturedStderr err;
    TestApp app;
};

class NullMessage : public QGF::LogicalException {
public:
    NullMessage() : QGF::LogicalException("") {}
    const char* message() const noexcept override { return nullptr; }
};

class NullWhat : public std::exception {
public:
    const char* what() const noexcept override { return nullptr; }
};

TEST_F(AppRun, WithoutOptionsEndsWithZero)
{
    InSequence([](GPUAssayTester&) {});
    EXPECT_EQ(app.RunWith({}), 0);
    EXPECT_THAT(app.out, ElementsAre("assayStart=\"now\"", "assayEnd=\"now\""));
    EXPECT_THAT(err.Take(), IsEmpty());
    EXPECT_EQ(app.GetAppName(), "assay");
}

TEST_F(AppRun, TakesAnEmptyArgumentList)
{
    InSequence([](GPUAssayTester&) {});
    GPUAssayApp::Arguments none;
    EXPECT_EQ(app.Run(none), 0);
    EXPECT_EQ(app.GetAppName(), "");
}

TEST_F(AppRun, ConsumesItsArguments)
{
    InSequence([](GPUAssayTester&) {});
    GPUAssayApp::Arguments arguments = {"name", "-app=host", "-hang=1"};
    EXPECT_EQ(app.Run(arguments), 0);
    EXPECT_THAT(arguments, IsEmpty());
    EXPECT_EQ(app.GetAppName(), "host");
}

TEST_F(AppRun, ExitSetsTheStatusOfARunWithoutFailures)
{
    InSequence([](GPUAssayTester&) {});
    EXPECT_EQ(app.RunWith({"-exit=7"}), 7);
}

TEST_F(AppRun, ExitIsClampedToThirtyTwoBits)
{
    InSequence([](GPUAssayTester&) {});
    EXPECT_EQ(app.RunWith({"-exit=4294967295"}), std::numeric_limits<std::int32_t>::max());
}

TEST_F(AppRun, AFailedTestOverridesExit)
{
    InSequence([](GPUAssayTester& tester) { tester.fFailures = 1; });
    EXPECT_EQ(app.RunWith({"-exit=7"}), 2);
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(AppRun, AUsageErrorOverridesExit)
{
    InSequence([](GPUAssayTester&) {});
    EXPECT_EQ(app.RunWith({"-exit=7", "-foo"}), 3);
}

TEST_F(AppRun, AnUnknownOptionPrintsTheUsageAndNoReport)
{
    EXPECT_EQ(app.RunWith({"-foo"}), 3);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_EQ(err.Take(), Lines{"Usage exception: usage"} + kUsage);
}

TEST_F(AppRun, AllMalformedCommandLinesPrintTheSame)
{
    for (const char* bad :
         {"-help", "-help=1", "--help", "foo", "-crashAfter", "", "-", "-foo=1"}) {
        TestApp each;
        EXPECT_EQ(each.RunWith({bad}), 3) << bad;
        EXPECT_THAT(each.out, IsEmpty()) << bad;
        EXPECT_EQ(err.Take(), Lines{"Usage exception: usage"} + kUsage) << bad;
    }
}

TEST_F(AppRun, ValidOptionsAroundAnUnknownOneHaveTheirEffects)
{
    EXPECT_EQ(app.RunWith({"-stdout=x", "-bogus", "-comment=y"}), 3);
    EXPECT_THAT(app.out, ElementsAre("x", "# y"));
}

TEST_F(AppRun, HelpStopsAtOnce)
{
    EXPECT_EQ(app.RunWith({"-stdout=x", "-help", "-stdout=y"}), 3);
    EXPECT_THAT(app.out, ElementsAre("x"));
    EXPECT_EQ(err.Take(), Lines{"Usage exception: usage"} + kUsage);
}

TEST_F(AppRun, ReportsALogicalException)
{
    InSequence([](GPUAssayTester&) { throw QGF::LogicalException("no driver"); });
    EXPECT_EQ(app.RunWith({"-exit=7"}), 2);
    EXPECT_THAT(err.Take(), ElementsAre("QGF::LogicalException: no driver"));
    EXPECT_THAT(app.out, IsEmpty());
}

TEST_F(AppRun, ReportsAnInternalExceptionAsAStandardOne)
{
    InSequence([](GPUAssayTester&) { throw QGF::InternalException("file", 3, "a == b"); });
    EXPECT_EQ(app.RunWith({}), 2);
    EXPECT_THAT(err.Take(), ElementsAre("exception: file(3): a == b"));
}

TEST_F(AppRun, ReportsAStandardException)
{
    InSequence([](GPUAssayTester&) { throw std::bad_cast(); });
    EXPECT_EQ(app.RunWith({}), 2);
    EXPECT_THAT(err.Take(), ElementsAre("exception: std::bad_cast"));
}

TEST_F(AppRun, ReportsAnUnknownException)
{
    InSequence([](GPUAssayTester&) { throw 5; });
    EXPECT_EQ(app.RunWith({}), 2);
    EXPECT_THAT(err.Take(), ElementsAre("unknown exception"));
}

TEST_F(AppRun, PrintsANullText)
{
    InSequence([](GPUAssayTester&) { throw NullMessage(); });
    EXPECT_EQ(app.RunWith({}), 2);
    EXPECT_THAT(err.Take(), ElementsAre("QGF::LogicalException: <NULL>"));

    TestApp other;
    other.makeTester = [](GPUAssayApp* owner) {
        return new OneCallTester(owner, [](GPUAssayTester&) { throw NullWhat(); });
    };
    EXPECT_EQ(other.RunWith({}), 2);
    EXPECT_THAT(err.Take(), ElementsAre("exception: <NULL>"));
}

TEST_F(AppRun, CrashAfterZeroFailsAtTheFirstStep)
{
    app.makeTester = [](GPUAssayApp* owner) { return new GPUAssayTester(owner); };
    EXPECT_EQ(app.RunWith({"-crashAfter=0"}), 2);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_THAT(err.Take(), ElementsAre("exception: programmed failure"));
}

TEST_F(AppRun, CrashAfterTextIsCrashAfterZero)
{
    app.makeTester = [](GPUAssayApp* owner) { return new GPUAssayTester(owner); };
    EXPECT_EQ(app.RunWith({"-crashAfter=abc"}), 2);
    EXPECT_THAT(err.Take(), ElementsAre("exception: programmed failure"));
}

TEST_F(AppRun, ThrowAfterZeroThrowsAtTheFirstStep)
{
    app.makeTester = [](GPUAssayApp* owner) { return new GPUAssayTester(owner); };
    EXPECT_EQ(app.RunWith({"-throwAfter=0"}), 2);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_THAT(err.Take(), ElementsAre("exception: Programmed throw"));
}

TEST_F(AppRun, PassesTheStepSettingsToTheTester)
{
    std::uint32_t crashAfter = 0;
    std::int32_t throwAfter = 0;
    InSequence([&](GPUAssayTester& tester) {
        crashAfter = tester.fCrashAfter;
        throwAfter = tester.fThrowAfter;
    });
    EXPECT_EQ(app.RunWith({"-crashAfter=100", "-throwAfter=200"}), 0);
    EXPECT_EQ(crashAfter, 100U);
    EXPECT_EQ(throwAfter, 200);
}

TEST_F(AppRun, MinusOneMeansNever)
{
    std::uint32_t crashAfter = 0;
    InSequence([&](GPUAssayTester& tester) { crashAfter = tester.fCrashAfter; });
    EXPECT_EQ(app.RunWith({"-crashAfter=-1", "-throwAfter=-1"}), 0);
    EXPECT_EQ(crashAfter, 0xFFFFFFFFU);
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(AppRun, VerboseReachesTheDebugValueBeforeTheTesterIsMade)
{
    std::int32_t seen = 0;
    app.makeTester = [&](GPUAssayApp* owner) {
        seen = pmutil::GetDebugValue(pmutil::gGPUAssay);
        return new OneCallTester(owner, [](GPUAssayTester&) {});
    };
    EXPECT_EQ(app.RunWith({"-verbose=3"}), 0);
    EXPECT_EQ(seen, 3);
}

// Records the operations that Run calls.
class CountingApp : public TestApp {
public:
    void Init() override
    {
        calls.emplace_back("Init");
        TestApp::Init();
    }
    void Term() override { calls.emplace_back("Term"); }
    void ParseArguments(Arguments& arguments) override
    {
        calls.emplace_back("ParseArguments");
        TestApp::ParseArguments(arguments);
    }
    pmutil::PMLogger* CreateLogger() override
    {
        calls.emplace_back("CreateLogger");
        return TestApp::CreateLogger();
    }
    GPUAssayTester* CreateTester() override
    {
        calls.emplace_back("CreateTester");
        return TestApp::CreateTester();
    }
    Lines calls;
};

TEST_F(AppRun, CallsItsOperationsInOrder)
{
    CountingApp counting;
    counting.makeTester = [&](GPUAssayApp* owner) {
        return new OneCallTester(owner,
                                 [&](GPUAssayTester&) { counting.calls.emplace_back("tester"); });
    };
    EXPECT_EQ(counting.RunWith({}), 0);
    EXPECT_THAT(counting.calls, ElementsAre("Init", "CreateLogger", "ParseArguments",
                                            "CreateTester", "tester", "Term"));
}

TEST_F(AppRun, TermIsNotCalledAfterAFailure)
{
    CountingApp counting;
    EXPECT_EQ(counting.RunWith({"-foo"}), 3);
    EXPECT_THAT(counting.calls, ElementsAre("Init", "CreateLogger", "ParseArguments"));
}

TEST_F(AppRun, TermIsCalledAlsoWhenATestFailed)
{
    CountingApp counting;
    counting.makeTester = [](GPUAssayApp* owner) {
        return new OneCallTester(owner, [](GPUAssayTester& tester) { tester.fFailures = 1; });
    };
    EXPECT_EQ(counting.RunWith({}), 2);
    EXPECT_EQ(counting.calls.back(), "Term");
}

class FailingTermApp : public TestApp {
public:
    void Term() override { throw std::runtime_error("term"); }
};

TEST_F(AppRun, AnExceptionOfTermFailsTheRun)
{
    FailingTermApp failing;
    failing.makeTester = [](GPUAssayApp* owner) {
        return new OneCallTester(owner, [](GPUAssayTester&) {});
    };
    EXPECT_EQ(failing.RunWith({}), 2);
    EXPECT_THAT(err.Take(), ElementsAre("exception: term"));
}

TEST_F(AppRun, AFailedRunCanBeRepeated)
{
    EXPECT_EQ(app.RunWith({"-exit=7", "-foo"}), 3);
    InSequence([](GPUAssayTester&) {});
    EXPECT_EQ(app.RunWith({}), 0);
}

TEST_F(AppRun, UsageLinesComeFromTheOverride)
{
    class ShortUsage : public TestApp {
    public:
        void Usage(Arguments& lines) override { lines.emplace_back("just so"); }
    };
    ShortUsage app2;
    EXPECT_EQ(app2.RunWith({"-help"}), 3);
    EXPECT_THAT(err.Take(), ElementsAre("Usage exception: usage", "just so"));
}

TEST_F(AppRun, ALogicalExceptionIsCaughtFirst)
{
    class EarlyFailure : public TestApp {
    public:
        void Init() override { throw QGF::LogicalException("early"); }
    };
    EarlyFailure early;
    EXPECT_EQ(early.RunWith({"-stdout=x"}), 2);
    EXPECT_THAT(early.out, IsEmpty());
    EXPECT_THAT(err.Take(), ElementsAre("QGF::LogicalException: early"));
}

TEST(App, FallsBackToThePlainTester)
{
    TestApp app; // makes no tester of its own
    const boost::shared_ptr<GPUAssayTester> tester = app.GetTester();
    ASSERT_TRUE(tester);
    EXPECT_EQ(typeid(*tester), typeid(GPUAssayTester));
    EXPECT_EQ(app.GetTester(), tester);
    EXPECT_EQ(tester->fApp, &app);
}

TEST(App, TheDefaultTesterIsThePlainOne)
{
    GPUAssayApp app;
    EXPECT_EQ(typeid(*app.GetTester()), typeid(GPUAssayTester));
}

TEST(App, RunFallsBackToThePlainTester)
{
    const CapturedStderr err;
    TestApp app;
    EXPECT_EQ(app.RunWith({"-throwAfter=0"}), 2);
    EXPECT_EQ(typeid(*app.GetTester()), typeid(GPUAssayTester));
}

TEST(App, StepSettingsAreThoseOfTheTesterIfItExists)
{
    TestApp app;
    app.SetCrashAfter(5);
    app.SetThrowAfter(6);
    EXPECT_EQ(app.GetCrashAfter(), 5);
    EXPECT_EQ(app.GetThrowAfter(), 6);

    GPUAssayTester& tester = *app.GetTester();
    EXPECT_EQ(app.GetCrashAfter(), -1);
    EXPECT_EQ(app.GetThrowAfter(), -1);
    app.SetCrashAfter(7);
    app.SetThrowAfter(8);
    EXPECT_EQ(tester.fCrashAfter, 7U);
    EXPECT_EQ(tester.fThrowAfter, 8);
    tester.fCrashAfter = 9;
    tester.fThrowAfter = 10;
    EXPECT_EQ(app.GetCrashAfter(), 9);
    EXPECT_EQ(app.GetThrowAfter(), 10);
}

TEST(App, OptionsSetAnExistingTester)
{
    TestApp app;
    GPUAssayTester& tester = *app.GetTester();
    GPUAssayApp::Arguments arguments = {"-crashAfter=3", "-throwAfter=4"};
    app.ParseArguments(arguments);
    EXPECT_EQ(tester.fCrashAfter, 3U);
    EXPECT_EQ(tester.fThrowAfter, 4);
}

TEST(App, MakesAnAssayLoggerOnce)
{
    TestApp app;
    const boost::shared_ptr<pmutil::PMLogger> logger = app.GetLogger();
    ASSERT_TRUE(logger);
    EXPECT_EQ(typeid(*logger), typeid(pmutil::AssayLogger));
    EXPECT_EQ(app.GetLogger(), logger);
}

// Records its destruction.
template <typename Base>
class DestructionRecorder : public Base {
public:
    template <typename... Arguments>
    DestructionRecorder(Lines& ends, std::string name, Arguments&&... arguments)
        : Base(std::forward<Arguments>(arguments)...), fEnds(ends), fName(std::move(name))
    {}
    ~DestructionRecorder() override { fEnds.push_back(fName); }

private:
    Lines& fEnds;
    std::string fName;
};

TEST(App, TheTesterIsDestroyedBeforeTheLogger)
{
    class EndingApp : public TestApp {
    public:
        explicit EndingApp(Lines& ends) : fEnds(ends) {}
        pmutil::PMLogger* CreateLogger() override
        {
            return new DestructionRecorder<pmutil::AssayLogger>(fEnds, "logger");
        }

    private:
        Lines& fEnds;
    };
    Lines ends;
    {
        EndingApp app(ends);
        app.makeTester = [&ends](GPUAssayApp* owner) {
            return new DestructionRecorder<GPUAssayTester>(ends, "tester", owner);
        };
        app.GetTester();
        app.GetLogger();
    }
    EXPECT_THAT(ends, ElementsAre("tester", "logger"));
}

TEST(App, TheOpenCLDevicesAreDestroyedBeforeTheOthers)
{
    Lines ends;
    {
        TestApp app;
        GPUAssayTester tester(&app);
        tester.fGLGPUs.push_back(
            {"gl", MakeGL(boost::make_shared<DestructionRecorder<FakeGPUImpl>>(ends, "gl"))});
        tester.fCLGPUs.push_back(
            {"cl", MakeCL(boost::make_shared<DestructionRecorder<FakeGPUImpl>>(ends, "cl"))});
    }
    EXPECT_THAT(ends, ElementsAre("cl", "gl"));
}

TEST(App, AnEscapedExceptionIsStatus4)
{
    EXPECT_EQ(RunToStatus([] { return 7; }), 7);
    CapturedStderr err;
    EXPECT_EQ(RunToStatus([]() -> int { throw std::bad_alloc(); }), 4);
    EXPECT_EQ(RunToStatus([]() -> int { throw 1; }), 4);
    // The usage text of status 3 throws.
    class Speechless : public TestApp {
        void Usage(Arguments& /*lines*/) override { throw std::runtime_error("speechless"); }
    };
    EXPECT_EQ(RunToStatus([] { return Speechless().RunWith({"-help"}); }), 4);
    EXPECT_THAT(err.Take(), ElementsAre("Usage exception: usage"));
}

TEST(App, TheBaseHasOnlyADestructor)
{
    EXPECT_TRUE(std::is_abstract_v<GPUAssayAppAndHost>);
    EXPECT_TRUE(std::has_virtual_destructor_v<GPUAssayAppAndHost>);
    EXPECT_TRUE((std::is_base_of_v<GPUAssayAppAndHost, GPUAssayApp>));
    EXPECT_TRUE((std::is_base_of_v<GPUAssayAppAndHost, GPUAssayTester>));
}

TEST(App, TheUsageExceptionHasItsText)
{
    EXPECT_STREQ(GPUAssayApp::UsageException().what(), "usage");
    EXPECT_TRUE((std::is_base_of_v<std::runtime_error, GPUAssayApp::UsageException>));
}

TEST(App, PixmereAssayIsASingletonWithThePixmereTester)
{
    PixmereAssay& app = PixmereAssay::Instance();
    EXPECT_EQ(&app, &PixmereAssay::Instance());
    const std::unique_ptr<GPUAssayTester> tester(app.CreateTester());
    EXPECT_EQ(typeid(*tester), typeid(PixmereTester));
    EXPECT_EQ(tester->fApp, &app);
}

} // namespace
} // namespace assay
