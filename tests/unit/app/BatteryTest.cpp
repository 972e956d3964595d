// The keys of a device, separately and in whole runs.
#include <stdexcept>

#include <gmock/gmock.h>

#include "AppFixtures.h"
#include "Clock.h"
#include "GPUTest.h"
#include "pmutil/PMLogging.h"
#include "pmutil/System.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "support/CapturedLog.h"

namespace assay {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

// A key test: its query, and the line it prints for a FakeGPUImpl.
struct KeyRow {
    const char* operation;
    const char* line;
};

constexpr KeyRow kGLKeys[] = {
    {"GLVersion", "GLVersion=\"GLVersion\""},
    {"IsIntegratedGLGPU", "IsIntegratedGLGPU=1"},
    {"GLMemoryMB", "GLMemoryMB=4294967295"},
    {"GLName", "GLName=\"GLName\""},
    {"GLVendor", "GLVendor=\"GLVendor\""},
    {"GLVendorID", "GLVendorID=4318"},
    {"GLDriverVersion", "GLDriverVersion=\"GLDriverVersion\""},
    {"GLRectTextureSize", "GLRectTextureSize=16384"},
    {"GLRenderer", "GLRenderer=\"GLRenderer\""},
    {"GLRendererID", "GLRendererID=7"},
    {"HasGLNPOTSupport", "HasGLNPOTSupport=1"},
    {"GLDriver", "GLDriver=\"GLDriver\""},
    {"GLDriverDate", "GLDriverDate=\"GLDriverDate\""},
    {"CanCompileProgramGLSL", "CanCompileProgramGLSL=1"},
    {"GLFrameBufferOK", "GLFrameBufferOK=1"},
};

constexpr KeyRow kCLKeys[] = {
    {"CLPlatformVersion", "CLPlatformVersion=\"CLPlatformVersion\""},
    {"CLDeviceVersion", "CLDeviceVersion=\"CLDeviceVersion\""},
    {"IsIntegratedCLGPU", "IsIntegratedCLGPU=1"},
    {"CLMemoryMB", "CLMemoryMB=2048"},
    {"CLName", "CLName=\"CLName\""},
    {"CLVendor", "CLVendor=\"CLVendor\""},
    {"CLVendorID", "CLVendorID=4098"},
    {"CLDriverVersion", "CLDriverVersion=\"CLDriverVersion\""},
    {"CUDASupported", "CUDASupported=1"},
    {"CUDAVersion", "CUDAVersion=\"4.2\""},
    {"CLBandwidth", "CLBandwidth=1.23457e+09"},
};

// The battery's lines for a FakeGPUImpl; "@" stands for the tag.
const std::vector<Lines> kBattery = {
    {"gputag.GL_SHADING_LANGUAGE_VERSION=35724",
     "@.glGetString[GL_SHADING_LANGUAGE_VERSION]=\"4.60\""},
    {"gputag.GL_FRAGMENT_PROGRAM_ARB=34820", "gputag.GL_MAX_PROGRAM_INSTRUCTIONS_ARB=34977",
     "@.glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][GL_MAX_PROGRAM_INSTRUCTIONS_ARB]=[16]"},
    {"gputag.GL_MAX_TEXTURE_UNITS=34018", "@.glGetIntegerv[GL_MAX_TEXTURE_UNITS]=[16]"},
    {"gputag.GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS=35661",
     "@.glGetIntegerv[GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS]=[16]"},
    {"gputag.GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS=35660",
     "@.glGetIntegerv[GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS]=[16]"},
    {"gputag.GL_MAX_TEXTURE_IMAGE_UNITS=34930", "@.glGetIntegerv[GL_MAX_TEXTURE_IMAGE_UNITS]=[16]"},
    {"gputag.GL_MAX_DRAW_BUFFERS=34852", "@.glGetIntegerv[GL_MAX_DRAW_BUFFERS]=[16]"},
    {"gputag.GL_MAX_VERTEX_UNIFORM_COMPONENTS=35658",
     "@.glGetIntegerv[GL_MAX_VERTEX_UNIFORM_COMPONENTS]=[16]"},
    {"gputag.GL_MAX_FRAGMENT_UNIFORM_COMPONENTS=35657",
     "@.glGetIntegerv[GL_MAX_FRAGMENT_UNIFORM_COMPONENTS]=[16]"},
    {"gputag.GL_MAX_VARYING_FLOATS=35659", "@.glGetIntegerv[GL_MAX_VARYING_FLOATS]=[16]"},
    {"gputag.GL_MAX_VERTEX_ATTRIBS=34921", "@.glGetIntegerv[GL_MAX_VERTEX_ATTRIBS]=[16]"},
    {"gputag.QGF::OGL::GL_ARB_VERTEX_PROGRAM=69", "@.extension[QGF::OGL::GL_ARB_VERTEX_PROGRAM]=1"},
    {"gputag.QGF::OGL::GL_ARB_FRAGMENT_PROGRAM=27",
     "@.extension[QGF::OGL::GL_ARB_FRAGMENT_PROGRAM]=1"},
    {"gputag.QGF::OGL::GL_ARB_VERTEX_SHADER=70", "@.extension[QGF::OGL::GL_ARB_VERTEX_SHADER]=1"},
    {"gputag.QGF::OGL::GL_ARB_FRAGMENT_SHADER=28",
     "@.extension[QGF::OGL::GL_ARB_FRAGMENT_SHADER]=1"},
    {"gputag.QGF::OGL::GL_EXT_FRAMEBUFFER_OBJECT=81",
     "@.extension[QGF::OGL::GL_EXT_FRAMEBUFFER_OBJECT]=1"},
    {"gputag.QGF::OGL::GL_ARB_TEXTURE_RECTANGLE=58",
     "@.extension[QGF::OGL::GL_ARB_TEXTURE_RECTANGLE]=1"},
    {"gputag.QGF::OGL::GL_ARB_TEXTURE_FLOAT=53", "@.extension[QGF::OGL::GL_ARB_TEXTURE_FLOAT]=1"},
    {"gputag.QGF::OGL::GL_ARB_OCCLUSION_QUERY=37",
     "@.extension[QGF::OGL::GL_ARB_OCCLUSION_QUERY]=1"},
    {"gputag.QGF::OGL::GL_ARB_VERTEX_BUFFER_OBJECT=68",
     "@.extension[QGF::OGL::GL_ARB_VERTEX_BUFFER_OBJECT]=1"},
    {"gputag.QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD=47",
     "@.extension[QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD]=1"},
};

std::string WithTag(std::string line, const std::string& tag)
{
    return line.front() == '@' ? line.replace(0, 1, tag) : line;
}

std::string Tag(const char* kind, std::size_t index)
{
    return std::string(kind) + "[" + std::to_string(index) + "]";
}

// An event of a run: lines and a step, for a device or for none.
struct Event {
    int device; // 0, 1, ... through both kinds; -1 for none
    Lines lines;
    bool step = true;
};

// The events of a PixmereTester's run, from the tables of this file.
std::vector<Event> PixmereRun(std::size_t gl, std::size_t cl)
{
    std::vector<Event> run = {{-1, {}},
                              {-1, {"Tester=\"Pixmere\""}},
                              {-1, {"assayStart=\"2031-02-03_04:05:06\""}},
                              {-1, {"QGFCoreInitialized=1"}},
                              {-1, {"QGFOGLInitialized=1"}},
                              {-1, {"OGLContextCreated=1"}},
                              {-1, {"NumGLGPUs=" + std::to_string(gl)}}};
    const auto each = [&run](const char* kind, std::size_t count, std::size_t first,
                             const Lines& lines, bool step) {
        for (std::size_t i = 0; i < count; ++i) {
            Event event{static_cast<int>(first + i), {}, step};
            for (const std::string& line : lines)
                event.lines.push_back(WithTag(line, Tag(kind, i)));
            run.push_back(event);
        }
    };
    for (const KeyRow& key : kGLKeys)
        each("glgpu", gl, 0, {std::string("@.") + key.line}, true);
    for (const Lines& row : kBattery)
        each("glgpu", gl, 0, row, &row != &kBattery.front());
    run.push_back({-1, {"NumCLGPUs=" + std::to_string(cl)}});
    for (const KeyRow& key : kCLKeys)
        each("clgpu", cl, gl, {std::string("@.") + key.line}, true);
    each("clgpu", cl, gl, {"@.CLCompute=32"}, true);
    run.push_back({-1, {"assayEnd=\"2031-02-03_04:05:06\""}});
    run.push_back({-1, {}});
    return run;
}

struct Outcome {
    Lines out;
    Lines err;
    std::int32_t status = 0;
};

// Predicts the outcome of a run with these programmed failures; -1 for none.
Outcome Predict(const std::vector<Event>& run, std::int64_t crashAfter, std::int64_t throwAfter)
{
    Outcome outcome;
    std::vector<bool> gone(16);
    std::int64_t step = 0;
    for (const Event& event : run) {
        if (event.device >= 0 && gone[static_cast<std::size_t>(event.device)])
            continue;
        outcome.out = outcome.out + event.lines;
        if (!event.step)
            continue;
        const std::int64_t number = step++;
        const bool crash = crashAfter >= 0 && number >= crashAfter;
        if (!crash && number != throwAfter)
            continue;
        outcome.err.emplace_back(crash ? "exception: programmed failure"
                                       : "exception: Programmed throw");
        outcome.status = 2;
        if (event.device < 0)
            break;
        gone[static_cast<std::size_t>(event.device)] = true;
    }
    return outcome;
}

void ExpectRun(const FakeMachine& machine, const std::string& option, const Outcome& expected)
{
    CapturedStderr err;
    MachineApp<PixmereTester> app(machine);
    const std::int32_t status = app.RunWith(option.empty() ? Lines{} : Lines{option});
    EXPECT_EQ(app.out, expected.out) << option;
    EXPECT_EQ(err.Take(), expected.err) << option;
    EXPECT_EQ(status, expected.status) << option;
}

class WholeRun : public testing::TestWithParam<std::pair<std::size_t, std::size_t>> {
protected:
    const std::size_t gl = GetParam().first;
    const std::size_t cl = GetParam().second;
};

TEST_P(WholeRun, IsComplete)
{
    ExpectRun(FakeMachine(gl, cl), "", Predict(PixmereRun(gl, cl), -1, -1));
}

TEST_P(WholeRun, CrashesAtEachStep)
{
    const std::vector<Event> run = PixmereRun(gl, cl);
    const auto last = static_cast<std::int64_t>(run.size());
    for (std::int64_t step = 0; step <= last; ++step)
        ExpectRun(FakeMachine(gl, cl), "-crashAfter=" + std::to_string(step),
                  Predict(run, step, -1));
}

TEST_P(WholeRun, ThrowsAtEachStep)
{
    const std::vector<Event> run = PixmereRun(gl, cl);
    const auto last = static_cast<std::int64_t>(run.size());
    for (std::int64_t step = 0; step <= last; ++step)
        ExpectRun(FakeMachine(gl, cl), "-throwAfter=" + std::to_string(step),
                  Predict(run, -1, step));
}

INSTANTIATE_TEST_SUITE_P(Machines, WholeRun,
                         testing::Values(std::make_pair(0, 0), std::make_pair(1, 0),
                                         std::make_pair(0, 1), std::make_pair(1, 1),
                                         std::make_pair(2, 2)));

TEST(WholeRunSteps, OneDeviceOfEachKindTakesFiftySeven)
{
    MachineApp<PixmereTester> app(FakeMachine(1, 1));
    EXPECT_EQ(app.RunWith({}), 0);
    EXPECT_EQ(app.GetTester()->fStep, 57U);
    EXPECT_EQ(app.GetTester()->fFailures, 0);
}

TEST(GLKeys, EachFailureSkipsTheRestOfItsDevice)
{
    for (const KeyRow& failing : kGLKeys) {
        CapturedStderr err;
        const FakeMachine machine(2, 0, false);
        machine.gl[0]->failures[failing.operation] = [] { throw std::runtime_error("bad"); };
        MachineApp<GPUAssayTester> app(machine);
        EXPECT_EQ(app.RunWith({}), 2);

        Lines expected;
        bool gone = false;
        for (const KeyRow& key : kGLKeys) {
            gone = gone || key.operation == std::string(failing.operation);
            if (!gone)
                expected.push_back(std::string("glgpu[0].") + key.line);
            expected.push_back(std::string("glgpu[1].") + key.line);
        }
        const Lines keys(app.out.begin() + 5, app.out.end() - 1);
        EXPECT_EQ(keys, expected) << failing.operation;
        EXPECT_THAT(err.Take(), ElementsAre("exception: bad")) << failing.operation;
        EXPECT_EQ(app.GetTester()->fFailures, 1);
        EXPECT_EQ(app.GetTester()->fGLGPUs.size(), 1U);
    }
}

TEST(CLKeys, EachFailureSkipsTheRestOfItsDevice)
{
    Lines operations;
    for (const KeyRow& key : kCLKeys)
        operations.emplace_back(key.operation);
    operations.emplace_back("CLCompute");
    for (const std::string& failing : operations) {
        CapturedStderr err;
        const FakeMachine machine(0, 2);
        machine.cl[1]->failures[failing] = [] { throw QGF::LogicalException("bad"); };
        MachineApp<PixmereTester> app(machine);
        EXPECT_EQ(app.RunWith({}), 2);

        Lines expected;
        bool gone = false;
        for (const std::string& operation : operations) {
            gone = gone || operation == failing;
            std::string line = "CLCompute=32";
            for (const KeyRow& key : kCLKeys)
                if (operation == key.operation)
                    line = key.line;
            expected.push_back("clgpu[0]." + line);
            if (!gone)
                expected.push_back("clgpu[1]." + line);
        }
        const Lines keys(app.out.begin() + 7, app.out.end() - 1);
        EXPECT_EQ(keys, expected) << failing;
        EXPECT_THAT(err.Take(), ElementsAre("QGF::LogicalException: bad")) << failing;
        EXPECT_EQ(app.GetTester()->fCLGPUs.size(), 1U);
    }
}

class OneDevice : public testing::Test {
protected:
    FakeGPU impl = boost::make_shared<FakeGPUImpl>();
    boost::shared_ptr<pmutil::GLGPU> gl = MakeGL(impl);
    boost::shared_ptr<pmutil::CLGPU> cl = MakeCL(impl);
    TestApp app;
    FakeTester<PixmereTester> tester{&app, {}};
};

TEST_F(OneDevice, TextIsPrintedUnescaped)
{
    impl->suffix = "\"a\\b\nc\xFF";
    tester.DoRunGLVendor("glgpu[0]", *gl);
    EXPECT_THAT(app.out, ElementsAre("glgpu[0].GLVendor=\"GLVendor\"a\\b\nc\xFF\""));
}

TEST_F(OneDevice, ZeroBytesAreKept)
{
    impl->suffix = std::string("\0x", 2);
    tester.DoRunCLName("t", *cl);
    EXPECT_THAT(app.out, ElementsAre(std::string("t.CLName=\"CLName\0x\"", 19)));
}

TEST_F(OneDevice, FalseIsZero)
{
    impl->truth = false;
    tester.DoRunIsIntegratedGLGPU("t", *gl);
    tester.DoRunHasGLNPOTSupport("t", *gl);
    tester.DoRunCanCompileProgramGLSL("t", *gl);
    tester.DoRunGLFrameBufferOK("t", *gl);
    tester.DoRunIsIntegratedCLGPU("t", *cl);
    tester.DoRunExtension("t", *gl, "E", 5);
    EXPECT_THAT(app.out, ElementsAre("t.IsIntegratedGLGPU=0", "t.HasGLNPOTSupport=0",
                                     "t.CanCompileProgramGLSL=0", "t.GLFrameBufferOK=0",
                                     "t.IsIntegratedCLGPU=0", "gputag.E=5", "t.extension[E]=0"));
}

TEST_F(OneDevice, DoublesHaveSixSignificantDigits)
{
    for (const double value : {3355443200.0, 0.0, 0.1, 123456.0, 1234567.0, 1e300}) {
        impl->bandwidth = value;
        impl->compute = value;
        tester.DoRunCLBandwidth("t", *cl);
        tester.DoRunCLCompute("t", *cl);
    }
    EXPECT_THAT(app.out,
                ElementsAre("t.CLBandwidth=3.35544e+09", "t.CLCompute=3.35544e+09",
                            "t.CLBandwidth=0", "t.CLCompute=0", "t.CLBandwidth=0.1",
                            "t.CLCompute=0.1", "t.CLBandwidth=123456", "t.CLCompute=123456",
                            "t.CLBandwidth=1.23457e+06", "t.CLCompute=1.23457e+06",
                            "t.CLBandwidth=1e+300", "t.CLCompute=1e+300"));
}

TEST_F(OneDevice, TheQueryPrecedesTheLine)
{
    impl->failures["GLName"] = [] { throw std::runtime_error("bad"); };
    EXPECT_THROW(tester.DoRunGLName("t", *gl), std::runtime_error);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_EQ(tester.fStep, 0U);
}

TEST_F(OneDevice, CUDAVersionIsPrintedOnlyIfThereIsOne)
{
    tester.DoRunCUDAVersion("t", *cl);
    EXPECT_THAT(app.out, ElementsAre("t.CUDAVersion=\"4.2\""));
    EXPECT_THAT(impl->queries, ElementsAre("CUDASupported", "CUDAVersion"));
    EXPECT_EQ(tester.fStep, 1U);

    app.out.clear();
    impl->queries.clear();
    impl->cudaVersion = "";
    tester.DoRunCUDAVersion("t", *cl);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_EQ(tester.fStep, 2U);

    impl->queries.clear();
    impl->cudaSupported = false;
    tester.DoRunCUDAVersion("t", *cl);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_THAT(impl->queries, ElementsAre("CUDASupported"));
    EXPECT_EQ(tester.fStep, 3U);
}

TEST_F(OneDevice, TheBandwidthMeasurementIsALogScope)
{
    const assay_test::CapturedLog log(pmutil::gGPUAssay);
    std::string atMeasurement;
    impl->failures["CLBandwidth"] = [&] { atMeasurement = log.Text(); };

    for (const std::int32_t quiet : {0, -1}) {
        pmutil::GetDebugValue(pmutil::gGPUAssay) = quiet;
        tester.DoRunCLBandwidth("t", *cl);
        EXPECT_EQ(log.Text(), "") << quiet;
    }

    pmutil::GetDebugValue(pmutil::gGPUAssay) = 1;
    tester.DoRunCLBandwidth("t", *cl);
    EXPECT_EQ(atMeasurement, "BEGIN GPUAssayTester::DoRunCLBandwidth\n");
    EXPECT_THAT(log.Text(), StartsWith("BEGIN GPUAssayTester::DoRunCLBandwidth\n"
                                       "END GPUAssayTester::DoRunCLBandwidth, duration="));
    EXPECT_THAT(app.out, ElementsAre("t.CLBandwidth=1.23457e+09", "t.CLBandwidth=1.23457e+09",
                                     "t.CLBandwidth=1.23457e+09"));
}

TEST_F(OneDevice, TheDelayIsNoneUntilItIsSet)
{
    pmutil::InitLogging();
    tester.DoRunCLBandwidth("t", *cl);
    static pmutil::DebugValue delay{"GPUAssayOCLDelay", 7};
    EXPECT_EQ(pmutil::GetDebugValue(delay), 0);
}

TEST_F(OneDevice, TheDelayPrecedesTheMeasurement)
{
    pmutil::InitLogging();
    static pmutil::DebugValue delay{"GPUAssayOCLDelay", 0};
    pmutil::GetDebugValue(delay) = 0;
    tester.DoRunCLBandwidth("t", *cl); // the first look at a debug value reads the clock
    SteppingClock clock(0.25);
    double measured = -1;
    impl->failures["CLBandwidth"] = [&] { measured = clock.fSeconds; };
    tester.DoRunCLBandwidth("t", *cl);
    EXPECT_EQ(measured, 0) << "there is no delay";

    pmutil::GetDebugValue(delay) = 3;
    tester.DoRunCLBandwidth("t", *cl);
    pmutil::GetDebugValue(delay) = 0;
    EXPECT_EQ(measured, 3.25) << "the first reading is at 0.25";
}

TEST_F(OneDevice, GetStringPrintsItsCodeFirstAndTakesNoStep)
{
    tester.DoRunGLGetString("t", *gl, "GL_NAME", 35724);
    EXPECT_THAT(app.out, ElementsAre("gputag.GL_NAME=35724", "t.glGetString[GL_NAME]=\"4.60\""));
    EXPECT_THAT(impl->queries, ElementsAre("GLGetString 35724"));
    EXPECT_EQ(tester.fStep, 0U);
}

TEST_F(OneDevice, ANullStringThrows)
{
    impl->shadingLanguage = nullptr;
    EXPECT_THAT(
        [this] { tester.DoRunGLGetString("t", *gl, "GL_NAME", 1); },
        testing::ThrowsMessage<std::logic_error>("glGetString returns no text for GL_NAME"));
    EXPECT_THAT(app.out, ElementsAre("gputag.GL_NAME=1"));
}

TEST_F(OneDevice, GetIntegervQueriesBeforeItsFirstLine)
{
    tester.DoRunGLGetIntegerv("t", *gl, "GL_NAME", -5, 1);
    EXPECT_THAT(app.out, ElementsAre("gputag.GL_NAME=-5", "t.glGetIntegerv[GL_NAME]=[16]"));
    EXPECT_EQ(tester.fStep, 1U);

    app.out.clear();
    impl->failures["GLGetIntegerv 7"] = [] { throw std::runtime_error("bad"); };
    EXPECT_THROW(tester.DoRunGLGetIntegerv("t", *gl, "GL_NAME", 7, 1), std::runtime_error);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_EQ(tester.fStep, 1U);
}

TEST_F(OneDevice, ListsOfIntegersStartAtZero)
{
    impl->integer = -1;
    tester.DoRunGLGetIntegerv("t", *gl, "N", 1, 3);
    tester.DoRunGLGetIntegerv("t", *gl, "N", 1, 0);
    tester.DoRunGLGetProgramivARB("t", *gl, "N", 1, 2);
    tester.DoRunGLGetProgramivARB("t", *gl, "N", 1, 0);
    EXPECT_THAT(app.out,
                ElementsAre("gputag.N=1", "t.glGetIntegerv[N]=[-1, 0, 0]", "gputag.N=1",
                            "t.glGetIntegerv[N]=]", "gputag.GL_FRAGMENT_PROGRAM_ARB=34820",
                            "gputag.N=1", "t.glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][N]=[-1, 0]",
                            "gputag.GL_FRAGMENT_PROGRAM_ARB=34820", "gputag.N=1",
                            "t.glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][N]=]"));
}

TEST_F(OneDevice, GetProgramivPrintsItsCodesBeforeTheQuery)
{
    impl->failures["GLGetProgramivARB 34820 9"] = [] { throw std::runtime_error("bad"); };
    EXPECT_THROW(tester.DoRunGLGetProgramivARB("t", *gl, "N", 9, 1), std::runtime_error);
    EXPECT_THAT(app.out, ElementsAre("gputag.GL_FRAGMENT_PROGRAM_ARB=34820", "gputag.N=9"));
    EXPECT_EQ(tester.fStep, 0U);
}

TEST_F(OneDevice, ExtensionPrintsItsIdBeforeTheQuery)
{
    impl->failures["GLIsExtensionSupported 9"] = [] { throw std::runtime_error("bad"); };
    EXPECT_THROW(tester.DoRunExtension("t", *gl, "E", 9), std::runtime_error);
    EXPECT_THAT(app.out, ElementsAre("gputag.E=9"));
    tester.DoRunExtension("t", *gl, "E", 8);
    EXPECT_THAT(app.out, ElementsAre("gputag.E=9", "gputag.E=8", "t.extension[E]=1"));
    EXPECT_EQ(tester.fStep, 1U);
}

TEST_F(OneDevice, TestsCallTheirQuery)
{
    const GPUEntry entry{"t", gl};
    GLStringTest("S", 1).Run(tester, entry);
    IntegervTest("I", 2, 1).Run(tester, entry);
    ProgramvTest("P", 3, 1).Run(tester, entry);
    ExtensionTest("E", 4).Run(tester, entry);
    EXPECT_THAT(impl->queries,
                ElementsAre("GLGetString 1", "GLGetIntegerv 2", "GLGetProgramivARB 34820 3",
                            "GLIsExtensionSupported 4"));
}

TEST_F(OneDevice, TestsRejectTheWrongTypeOfDevice)
{
    const GPUEntry entry{"t", cl};
    EXPECT_THROW(GLStringTest("S", 1).Run(tester, entry), std::bad_cast);
    EXPECT_THROW(IntegervTest("I", 2, 1).Run(tester, entry), std::bad_cast);
    EXPECT_THROW(ProgramvTest("P", 3, 1).Run(tester, entry), std::bad_cast);
    EXPECT_THROW(ExtensionTest("E", 4).Run(tester, entry), std::bad_cast);
    EXPECT_THAT(app.out, IsEmpty());
}

TEST_F(OneDevice, TestFuncRejectsTheWrongTypeOfTester)
{
    GPUAssayTester plain(&app);
    const TestFunc<PixmereTester, pmutil::CLGPU> compute(&PixmereTester::DoRunCLCompute);
    EXPECT_THROW(compute.Run(plain, GPUEntry{"t", cl}), std::bad_cast);
    compute.Run(tester, GPUEntry{"t", cl});
    EXPECT_THAT(app.out, ElementsAre("t.CLCompute=32"));
}

TEST_F(OneDevice, AMissingDeviceFailsTheAssertion)
{
    const GPUEntry nothing{"t", nullptr};
    EXPECT_DEATH(GLStringTest("S", 1).Run(tester, nothing), "px != 0");
    EXPECT_DEATH(IntegervTest("I", 1, 1).Run(tester, nothing), "px != 0");
    EXPECT_DEATH(ProgramvTest("P", 1, 1).Run(tester, nothing), "px != 0");
    EXPECT_DEATH(ExtensionTest("E", 1).Run(tester, nothing), "px != 0");
}

TEST_F(OneDevice, TestsCallOverridesOfTheTester)
{
    class Tester : public GPUAssayTester {
    public:
        using GPUAssayTester::GPUAssayTester;
        void DoRunGLVersion(std::string tag, GLGPU&) override { seen = tag; }
        std::string seen;
    };
    Tester other(&app);
    TestFunc<GPUAssayTester, pmutil::GLGPU>(&GPUAssayTester::DoRunGLVersion)
        .Run(other, GPUEntry{"t", gl});
    EXPECT_EQ(other.seen, "t");
}

TEST(Battery, OfOneDeviceHasItsLinesAndSteps)
{
    MachineApp<PixmereTester> pixmere(FakeMachine(1, 0, false));
    MachineApp<GPUAssayTester> plain(FakeMachine(1, 0, false));
    EXPECT_EQ(pixmere.RunWith({}), 0);
    EXPECT_EQ(plain.RunWith({}), 0);
    EXPECT_EQ(pixmere.out.size(), plain.out.size() + 43 + 1);
    EXPECT_EQ(pixmere.GetTester()->fStep, plain.GetTester()->fStep + 20 + 1);

    int names = 0;
    int programs = 0;
    for (const std::string& line : pixmere.out)
        if (line == "gputag.GL_FRAGMENT_PROGRAM_ARB=34820")
            ++programs;
        else if (line.compare(0, 7, "gputag.") == 0)
            ++names;
    EXPECT_EQ(names, 21);
    EXPECT_EQ(programs, 1);
}

TEST(Battery, ThePlainTesterHasNone)
{
    MachineApp<GPUAssayTester> app(FakeMachine(1, 1));
    EXPECT_EQ(app.RunWith({}), 0);
    for (const std::string& line : app.out) {
        EXPECT_THAT(line, testing::Not(StartsWith("Tester=")));
        EXPECT_THAT(line, testing::Not(StartsWith("gputag.")));
        EXPECT_THAT(line, testing::Not(HasSubstr("CLCompute")));
    }
}

TEST(Battery, ADeviceThatFailsInItIsRemoved)
{
    CapturedStderr err;
    const FakeMachine machine(2, 0, false);
    machine.gl[0]->failures["GLGetIntegerv 34852"] = [] { throw std::runtime_error("bad"); };
    MachineApp<PixmereTester> app(machine);
    EXPECT_EQ(app.RunWith({}), 2);
    ASSERT_EQ(app.GetTester()->fGLGPUs.size(), 1U);
    EXPECT_EQ(app.GetTester()->fGLGPUs.front().tag, "glgpu[1]");
    EXPECT_EQ(app.GetTester()->fFailures, 1);
    EXPECT_THAT(err.Take(), ElementsAre("exception: bad"));
}

TEST(Battery, WorksOnACopyOfTheList)
{
    // Records the size of the tester's own list at each test of the battery.
    class Tester : public FakeTester<PixmereTester> {
    public:
        using FakeTester<PixmereTester>::FakeTester;
        void DoRunExtension(std::string, GLGPU&, const char*, std::int32_t) override
        {
            sizes.push_back(fGLGPUs.size());
            throw std::runtime_error("bad");
        }
        std::vector<std::size_t> sizes;
    };
    const CapturedStderr err;
    TestApp app;
    Tester tester(&app, FakeMachine(2, 0));
    tester.DoRunGLEnumerate();
    tester.DoRunGLTests();
    EXPECT_THAT(tester.sizes, ElementsAre(2U, 2U));
    EXPECT_THAT(tester.fGLGPUs, IsEmpty());
}

TEST(Battery, ADeviceThatFailedBeforeIsNotTested)
{
    const CapturedStderr err;
    const FakeMachine machine(1, 0, false);
    machine.gl[0]->failures["GLName"] = [] { throw std::runtime_error("bad"); };
    MachineApp<PixmereTester> app(machine);
    EXPECT_EQ(app.RunWith({}), 2);
    for (const std::string& line : app.out)
        EXPECT_THAT(line, testing::Not(StartsWith("gputag.")));
}

TEST(Enumerate, ReplacesTheListAndKeepsTheOrder)
{
    TestApp app;
    FakeTester<GPUAssayTester> tester(&app, FakeMachine(3, 2));
    tester.fGLGPUs.push_back({"old", nullptr});
    tester.fCLGPUs.push_back({"old", nullptr});
    tester.DoRunGLEnumerate();
    tester.DoRunCLEnumerate();
    EXPECT_THAT(app.out, ElementsAre("NumGLGPUs=3", "NumCLGPUs=2"));
    EXPECT_EQ(tester.fStep, 2U);
    Lines tags;
    for (const GPUEntry& entry : tester.fGLGPUs)
        tags.push_back(entry.tag);
    for (const GPUEntry& entry : tester.fCLGPUs)
        tags.push_back(entry.tag);
    EXPECT_THAT(tags, ElementsAre("glgpu[0]", "glgpu[1]", "glgpu[2]", "clgpu[0]", "clgpu[1]"));
}

TEST(Enumerate, AnExceptionEndsTheRunBeforeItsLine)
{
    TestApp app;
    FakeTester<GPUAssayTester> tester(&app, {});
    FakeGPUImpl factory;
    factory.failures["GPUs"] = [] { throw std::runtime_error("gl"); };
    factory.failures["CLGPUs"] = [] { throw std::runtime_error("cl"); };
    EXPECT_THROW(tester.EnumerateGL(factory), std::runtime_error);
    EXPECT_THROW(tester.EnumerateCL(factory), std::runtime_error);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_EQ(tester.fStep, 0U);
}

TEST(Enumerate, AProgrammedFailureKeepsTheDevices)
{
    TestApp app;
    FakeTester<GPUAssayTester> tester(&app, FakeMachine(2, 0));
    tester.fThrowAfter = 0;
    EXPECT_THROW(tester.DoRunGLEnumerate(), std::runtime_error);
    EXPECT_THAT(app.out, ElementsAre("NumGLGPUs=2"));
    EXPECT_EQ(tester.fGLGPUs.size(), 2U);
}

} // namespace
} // namespace assay
