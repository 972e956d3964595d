#include "pmutil_gpu/DriverFileLog.h"

#include <algorithm>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "TestModule.h"
#include "all/gpu/ModuleList.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "qgf/DriverCall.h"
#include "support/CapturedLog.h"

namespace {

using assay_test::CapturedLog;
using assay_test::LoadTestModule;
using assay_test::UnloadTestModule;
using QGF::Core::DriverCall;
using QGF::Core::Interface;
using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

constexpr char kBegin[] = "driver files are logged";

class DriverFileLogTest : public testing::Test {
public:
    DriverFileLogTest() = default;
    ~DriverFileLogTest() override { QGF::Core::ObserveDriverCalls(nullptr); }
    DriverFileLogTest(const DriverFileLogTest&) = delete;
    DriverFileLogTest& operator=(const DriverFileLogTest&) = delete;

protected:
    static void Begin(std::int32_t value)
    {
        pmutil::GetDebugValue(pmutil::gGPUAssay) = value;
        pmutil::LogDriverFiles();
    }

    CapturedLog fLog{pmutil::gGPUAssay};
};

TEST_F(DriverFileLogTest, IsOffWithoutItsBit)
{
    for (const int value : {0, 1, 2, 255, 512, -1, -256}) {
        Begin(value);
        EXPECT_FALSE(QGF::Core::IsObserved()) << value;
    }
    EXPECT_THAT(fLog.Lines(), IsEmpty());
}

TEST_F(DriverFileLogTest, LogsWhatACallLoads)
{
    Begin(pmutil::kLogDriverFiles);
    for (int time = 0; time < 2; ++time) {
        void* module = nullptr;
        {
            const DriverCall call(Interface::kOpenCL);
            module = LoadTestModule();
        }
        ASSERT_NE(module, nullptr);
        UnloadTestModule(module);
    }
    EXPECT_THAT(fLog.Lines(),
                ElementsAre(kBegin, AllOf(StartsWith("loaded for OpenCL: "), HasSubstr("module"))));
}

TEST_F(DriverFileLogTest, LogsForTheInterfaceThatLoadedFirst)
{
    Begin(0x101);
    void* module = nullptr;
    {
        const DriverCall call(Interface::kOpenGL);
        module = LoadTestModule();
    }
    ASSERT_NE(module, nullptr);
    {
        const DriverCall call(Interface::kOpenCL);
    }
    UnloadTestModule(module);
    EXPECT_THAT(fLog.Lines(), ElementsAre(kBegin, StartsWith("loaded for OpenGL: ")));
}

TEST_F(DriverFileLogTest, LogsNothingThatIsLoadedOutsideTheCalls)
{
    Begin(0x101);
    void* const module = LoadTestModule();
    ASSERT_NE(module, nullptr);
    {
        const DriverCall call(Interface::kOpenGL);
    }
    UnloadTestModule(module);
    EXPECT_THAT(fLog.Lines(), ElementsAre(kBegin));
}

TEST_F(DriverFileLogTest, BeginsOnce)
{
    Begin(0x101);
    pmutil::LogDriverFiles();
    EXPECT_THAT(fLog.Lines(), ElementsAre(kBegin));
}

TEST(ModuleList, HasALibraryWhileItIsLoaded)
{
    const auto hasIt = [] {
        const std::vector<std::string> paths = pmutil::ListModules();
        return std::any_of(paths.begin(), paths.end(), [](const std::string& path) {
            return path.find("test_module") != std::string::npos;
        });
    };
    EXPECT_FALSE(hasIt());
    const std::uint64_t before = pmutil::CountLoads();
    EXPECT_EQ(pmutil::CountLoads(), before);
    void* const module = LoadTestModule();
    ASSERT_NE(module, nullptr);
    EXPECT_NE(pmutil::CountLoads(), before);
    EXPECT_TRUE(hasIt());
    UnloadTestModule(module);
    EXPECT_FALSE(hasIt());
}

} // namespace
