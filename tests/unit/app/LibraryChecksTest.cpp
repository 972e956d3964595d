// The library checks and the enumerations, with a fake OpenGL and a fake OpenCL.
#include <stdexcept>

#include <gmock/gmock.h>

#include "AppFixtures.h"
#include "StartOpenCL.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "qgf/OCL.h"
#include "support/CapturedLog.h"
#include "support/FakeOpenGL.h"
#include "support/ScriptedAdapters.h"

namespace assay {
namespace {

using assay_test::CapturedLog;
using assay_test::FakeOpenGL;
using testing::ElementsAre;
using testing::IsEmpty;

class LibraryChecks : public testing::Test {
protected:
    void TearDown() override { QGF::Core::ReplaceLoaderCheck(nullptr); }

    // Checks the report line and the log lines of a check, and that it takes one step.
    void ExpectCheck(void (GPUAssayTester::*check)(), const std::string& line, const Lines& logged)
    {
        TestApp app;
        GPUAssayTester tester(&app);
        (tester.*check)();
        EXPECT_THAT(app.out, ElementsAre(line));
        EXPECT_EQ(tester.fStep, 1U);
        EXPECT_EQ(tester.fFailures, 0);

        CapturedLog log(pmutil::gGPUAssay);
        (tester.*check)();
        EXPECT_EQ(log.Lines(), logged);
    }

    CapturedStderr err;
};

constexpr auto kCore = &GPUAssayTester::DoRunQGFCoreInitialize;
constexpr auto kOGL = &GPUAssayTester::DoRunQGFOGLInitialize;
constexpr auto kContext = &GPUAssayTester::DoRunOGLContextCreate;

// Runs only the OpenGL half of the sequence.
class OGLTester : public GPUAssayTester {
public:
    using GPUAssayTester::GPUAssayTester;
    void DoRunQGFOCLInitialize() override {}
    std::string GetTimestamp() override { return "now"; }
};

class NullMessage : public QGF::LogicalException {
public:
    NullMessage() : QGF::LogicalException("") {}
    const char* message() const noexcept override { return nullptr; }
};

TEST_F(LibraryChecks, PassIfEverythingWorks)
{
    FakeOpenGL gl;
    ExpectCheck(kCore, "QGFCoreInitialized=1", {});
    ExpectCheck(kOGL, "QGFOGLInitialized=1", {});
    ExpectCheck(kContext, "OGLContextCreated=1", {});
    EXPECT_EQ(gl.devices[0].contexts, 0);
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(LibraryChecks, CoreFailsWithALineInTheLogOnly)
{
    QGF::Core::ReplaceLoaderCheck([] { throw QGF::LogicalException("no loader"); });
    ExpectCheck(kCore, "QGFCoreInitialized=0",
                {"QGF::Core::Library::initialize() failed: no loader"});
    QGF::Core::ReplaceLoaderCheck([] { throw std::runtime_error("not logged"); });
    ExpectCheck(kCore, "QGFCoreInitialized=0", {"QGF::Core::Library::initialize() failed"});
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(LibraryChecks, OGLFailsWithALineInTheLogOnly)
{
    FakeOpenGL gl;
    gl.onDisplayDevices = [] { throw QGF::LogicalException("no binding"); };
    ExpectCheck(kOGL, "QGFOGLInitialized=0",
                {"QGF::OGL::Library::initialize() failed: no binding"});
    gl.onDisplayDevices = [] { throw 1; };
    ExpectCheck(kOGL, "QGFOGLInitialized=0", {"QGF::OGL::Library::initialize() failed"});
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(LibraryChecks, ContextFailsWithALineInTheLogOnly)
{
    FakeOpenGL gl;
    gl.devices[0].onCreate = [] { throw QGF::LogicalException("no context"); };
    ExpectCheck(kContext, "OGLContextCreated=0",
                {"Cannot create default ContextOffscreen: no context"});
    gl.devices[0].onCreate = [] { throw NullMessage(); };
    ExpectCheck(kContext, "OGLContextCreated=0",
                {"Cannot create default ContextOffscreen: <NULL>"});
    gl.devices[0].onCreate = [] { throw std::runtime_error("not logged"); };
    ExpectCheck(kContext, "OGLContextCreated=0", {"Cannot create default ContextOffscreen"});
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(LibraryChecks, TheContextIsMadeOnTheFirstDeviceAndDestroyed)
{
    FakeOpenGL gl(2);
    TestApp app;
    GPUAssayTester(&app).DoRunOGLContextCreate();
    EXPECT_THAT(gl.callsOf("create"), ElementsAre("create fake0"));
    EXPECT_THAT(gl.callsOf("destroy"), ElementsAre("destroy fake0"));
}

TEST_F(LibraryChecks, AProgrammedFailureFollowsTheLine)
{
    FakeOpenGL gl;
    for (const auto check : {kCore, kOGL, kContext}) {
        TestApp app;
        GPUAssayTester tester(&app);
        tester.fCrashAfter = 0;
        EXPECT_THROW((tester.*check)(), std::runtime_error);
        EXPECT_EQ(app.out.size(), 1U);
    }
}

TEST_F(LibraryChecks, AllFailuresLeaveTheSequenceRunning)
{
    FakeOpenGL gl(0);
    QGF::Core::ReplaceLoaderCheck([] { throw QGF::LogicalException("no loader"); });
    const assay_test::ScriptedAdapters adapters;
    TestApp app;
    app.makeTester = [](GPUAssayApp* owner) { return new OGLTester(owner); };
    EXPECT_EQ(app.RunWith({}), 0);
    EXPECT_THAT(app.out,
                ElementsAre("assayStart=\"now\"", "QGFCoreInitialized=0", "QGFOGLInitialized=0",
                            "OGLContextCreated=0", "NumGLGPUs=0", "assayEnd=\"now\""));
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(LibraryChecks, AllFailuresLeaveTheEnumerationWorking)
{
    FakeOpenGL gl(2);
    QGF::Core::ReplaceLoaderCheck([] { throw QGF::LogicalException("no loader"); });
    int calls = 0;
    gl.onDisplayDevices = [&calls] { // fails the initialization of OpenGL and the context check
        if (++calls <= 2)
            throw QGF::LogicalException("not yet");
    };
    assay_test::ScriptedAdapters adapters;
    adapters.adapters = {assay_test::MakeAdapter(u"Fake GPU 0", 0x10DE, 1),
                         assay_test::MakeAdapter(u"Fake GPU 1", 0x10DE, 2)};
    {
        TestApp app;
        app.makeTester = [](GPUAssayApp* owner) { return new OGLTester(owner); };
        EXPECT_EQ(app.RunWith({}), 0);
        ASSERT_EQ(app.out.size(), 5U + 2U * 15U + 1U);
        EXPECT_EQ(Lines(app.out.begin(), app.out.begin() + 7),
                  (Lines{"assayStart=\"now\"", "QGFCoreInitialized=0", "QGFOGLInitialized=0",
                         "OGLContextCreated=0", "NumGLGPUs=2", "glgpu[0].GLVersion=\"4.1\"",
                         "glgpu[1].GLVersion=\"4.1\""}));
    }
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(LibraryChecks, OCLPrintsNothingAndTakesNoStep)
{
    TestApp app;
    GPUAssayTester tester(&app);
    CapturedLog log(pmutil::gGPUAssay);
    tester.DoRunQGFOCLInitialize();
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_EQ(tester.fStep, 0U);
    EXPECT_EQ(tester.fOCLAvailable, QGF::OCL::Library::IsOpenCLAvailable(""));
    EXPECT_EQ(log.Lines(), tester.fOCLAvailable
                               ? Lines{"DoRunQGFOCLInitialize: QGF::OCL::Library::initialize();"}
                               : Lines{});
}

TEST_F(LibraryChecks, OCLStaysAvailableIfItsInitializationFails)
{
    TestApp app;
    CapturedLog log(pmutil::gGPUAssay);
    bool available = false;
    StartOpenCL(
        available, [] { return true; }, [] { throw QGF::LogicalException("no start"); });
    EXPECT_TRUE(available);
    available = false;
    StartOpenCL(
        available, [] { return true; }, [] { throw 1; });
    EXPECT_TRUE(available);
    const std::string line = "DoRunQGFOCLInitialize: QGF::OCL::Library::initialize();";
    EXPECT_THAT(log.Lines(), ElementsAre(line, line));
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST_F(LibraryChecks, OCLIsInitializedOnlyIfAvailable)
{
    CapturedLog log(pmutil::gGPUAssay);
    int starts = 0;
    const auto start = [&starts] { ++starts; };
    bool available = false;
    StartOpenCL(
        available, []() -> bool { throw QGF::LogicalException("no answer"); }, start);
    EXPECT_FALSE(available);
    StartOpenCL(
        available, []() -> bool { throw 1; }, start);
    EXPECT_FALSE(available);
    StartOpenCL(
        available, [] { return false; }, start);
    EXPECT_FALSE(available);
    EXPECT_EQ(starts, 0);
    EXPECT_THAT(log.Lines(), IsEmpty());
    StartOpenCL(
        available, [] { return true; }, start);
    EXPECT_TRUE(available);
    EXPECT_EQ(starts, 1);
    EXPECT_THAT(err.Take(), IsEmpty());
}

TEST(GLEnumeration, ListsTheDevicesOfTheMachine)
{
    FakeOpenGL gl(2);
    assay_test::ScriptedAdapters adapters;
    adapters.adapters = {assay_test::MakeAdapter(u"Fake GPU 1", 0x10DE, 1),
                         assay_test::MakeAdapter(u"Fake GPU 0", 0x10DE, 2)};
    {
        TestApp app;
        GPUAssayTester tester(&app);
        tester.DoRunGLEnumerate();
        EXPECT_THAT(app.out, ElementsAre("NumGLGPUs=2"));
        EXPECT_EQ(tester.fStep, 1U);
        ASSERT_EQ(tester.fGLGPUs.size(), 2U);
        EXPECT_EQ(tester.fGLGPUs.front().tag, "glgpu[0]");
        EXPECT_EQ(tester.fGLGPUs.back().tag, "glgpu[1]");
        EXPECT_EQ(tester.fGLGPUs.front().gpu->GetName(), "Fake GPU 1");
        EXPECT_EQ(tester.fGLGPUs.back().gpu->GetName(), "Fake GPU 0");
    }
    EXPECT_EQ(gl.devices[0].contexts + gl.devices[1].contexts, 0);
}

// A fake OpenCL with one platform that has two GPUs, or with a failing list of platforms.
class ScriptedOpenCL {
public:
    explicit ScriptedOpenCL(cl_int platformStatus)
    {
        gPlatformStatus = platformStatus;
        QGF::OCL::FunctionTable table{};
        table.clGetPlatformIDs = GetPlatformIDs;
        table.clGetDeviceIDs = GetDeviceIDs;
        QGF::OCL::ExtensionManager::ReplaceTable(&table);
    }
    ~ScriptedOpenCL() { QGF::OCL::ExtensionManager::ReplaceTable(nullptr); }
    ScriptedOpenCL(const ScriptedOpenCL&) = delete;
    ScriptedOpenCL& operator=(const ScriptedOpenCL&) = delete;

private:
    static cl_int CL_API_CALL GetPlatformIDs(cl_uint capacity, cl_platform_id* ids, cl_uint* count)
    {
        if (gPlatformStatus != CL_SUCCESS)
            return gPlatformStatus;
        static int platform;
        if (ids != nullptr && capacity > 0)
            ids[0] = reinterpret_cast<cl_platform_id>(&platform);
        if (count != nullptr)
            *count = 1;
        return CL_SUCCESS;
    }
    static cl_int CL_API_CALL GetDeviceIDs(cl_platform_id, cl_device_type type, cl_uint capacity,
                                           cl_device_id* ids, cl_uint* count)
    {
        if (type != CL_DEVICE_TYPE_GPU)
            return CL_DEVICE_NOT_FOUND;
        static int devices[2];
        for (cl_uint i = 0; ids != nullptr && i < 2 && i < capacity; ++i)
            ids[i] = reinterpret_cast<cl_device_id>(&devices[i]);
        if (count != nullptr)
            *count = 2;
        return CL_SUCCESS;
    }

    static cl_int gPlatformStatus;
};

cl_int ScriptedOpenCL::gPlatformStatus = CL_SUCCESS;

TEST(CLEnumeration, ListsTheDevicesOfTheMachine)
{
    const ScriptedOpenCL opencl(CL_SUCCESS);
    TestApp app;
    GPUAssayTester tester(&app);
    tester.DoRunCLEnumerate();
    EXPECT_THAT(app.out, ElementsAre("NumCLGPUs=2"));
    EXPECT_EQ(tester.fStep, 1U);
    ASSERT_EQ(tester.fCLGPUs.size(), 2U);
    EXPECT_EQ(tester.fCLGPUs.front().tag, "clgpu[0]");
    EXPECT_EQ(tester.fCLGPUs.back().tag, "clgpu[1]");
    EXPECT_NE(tester.fCLGPUs.front().gpu->impl, tester.fCLGPUs.back().gpu->impl);
}

TEST(CLEnumeration, NoPlatformMeansNoDevice)
{
    constexpr cl_int kPlatformNotFound = -1001;
    const ScriptedOpenCL opencl(kPlatformNotFound);
    TestApp app;
    GPUAssayTester tester(&app);
    tester.DoRunCLEnumerate();
    EXPECT_THAT(app.out, ElementsAre("NumCLGPUs=0"));
    tester.DoRunCLTests();
    EXPECT_THAT(app.out, ElementsAre("NumCLGPUs=0"));
    EXPECT_EQ(tester.fStep, 1U);
}

TEST(CLEnumeration, AFailedPlatformEndsTheRun)
{
    const ScriptedOpenCL opencl(CL_OUT_OF_HOST_MEMORY);
    TestApp app;
    GPUAssayTester tester(&app);
    EXPECT_THROW(tester.DoRunCLEnumerate(), QGF::LogicalException);
    EXPECT_THAT(app.out, IsEmpty());
    EXPECT_EQ(tester.fStep, 0U);
}

} // namespace
} // namespace assay
