// The queries of an OpenCL device and the values computed from their results.
#include <new>
#include <stdexcept>
#include <utility>

#include <boost/make_shared.hpp>
#include <gmock/gmock.h>

#include "pmutil_gpu/GPU.h"
#include "pmutil_gpu/GPUImplWin.h"
#include "support/CapturedFailures.h"
#include "support/FakeOpenCL.h"
#include "support/FakeOpenGL.h"

namespace {

using assay_test::CLAnswer;
using assay_test::CLText;
using assay_test::CLValue;
using assay_test::FakeOpenCL;
using pmutil::GPUImplWin;
using testing::ElementsAre;
using testing::IsEmpty;

// Bytes; larger than any object.
constexpr std::size_t kHalfOfAddressSpace = std::size_t{1} << 63U;

// The text of the std::runtime_error that `action` throws; empty if it throws none.
template <typename Action>
std::string ErrorOf(const Action& action)
{
    try {
        action();
    } catch (const std::runtime_error& e) {
        return e.what();
    }
    return {};
}

CLAnswer Failing()
{
    return {"", {}, CL_INVALID_DEVICE, CL_INVALID_DEVICE};
}

class CLQueriesTest : public testing::Test {
protected:
    CLQueriesTest()
    {
        cl.platforms = {{7,
                         {{CL_PLATFORM_VERSION, CLText("OpenCL 1.2 CUDA 8.0.0")}},
                         {{21,
                           CL_DEVICE_TYPE_GPU,
                           {{CL_DEVICE_PLATFORM, CLValue(std::uintptr_t{7})},
                            {CL_DEVICE_NAME, CLText("Some device")},
                            {CL_DEVICE_VENDOR, CLText("Some vendor")},
                            {CL_DEVICE_VENDOR_ID, CLValue(cl_uint{0x1002})},
                            {CL_DEVICE_GLOBAL_MEM_SIZE, CLValue(cl_ulong{3} << 30U)},
                            {CL_DRIVER_VERSION, CLText("390.77")},
                            {CL_DEVICE_VERSION, CLText("OpenCL 1.2 something")},
                            {CL_DEVICE_HOST_UNIFIED_MEMORY, CLValue(cl_bool{CL_TRUE})}}}},
                         CL_SUCCESS,
                         {}}};
        impl.device = QGF::OCL::Device(FakeOpenCL::DeviceID(21));
    }

    std::map<cl_device_info, CLAnswer>& answers() { return cl.platforms[0].devices[0].answers; }
    void SetPlatformVersion(const std::string& text)
    {
        cl.platforms[0].answers[CL_PLATFORM_VERSION] = CLText(text);
    }

    FakeOpenCL cl;
    assay_test::CapturedFailures failures;
    GPUImplWin impl;
};

TEST_F(CLQueriesTest, NameAndVendorAreTheDevicesTexts)
{
    EXPECT_EQ(impl.GetCLName(), "Some device");
    EXPECT_EQ(impl.GetCLVendor(), "Some vendor");
}

TEST_F(CLQueriesTest, NameAndVendorAreCutAtTheFirstZeroByte)
{
    answers()[CL_DEVICE_NAME] = CLText(std::string("One\0two\0three", 13));
    answers()[CL_DEVICE_VENDOR] = CLText(std::string("\0two", 4));
    EXPECT_EQ(impl.GetCLName(), "One");
    EXPECT_EQ(impl.GetCLVendor(), "");
}

TEST_F(CLQueriesTest, NameAndVendorKeepQuotesNewlinesAndForeignBytes)
{
    answers()[CL_DEVICE_NAME] = CLText("a \"b\"\n\xFF\xFE");
    EXPECT_EQ(impl.GetCLName(), "a \"b\"\n\xFF\xFE");
}

TEST_F(CLQueriesTest, AFailedNameOrVendorThrowsTheLibrarysException)
{
    answers()[CL_DEVICE_NAME] = Failing();
    answers()[CL_DEVICE_VENDOR] = Failing();
    EXPECT_THROW(impl.GetCLName(), QGF::LogicalException);
    EXPECT_THROW(impl.GetCLVendor(), QGF::LogicalException);
    EXPECT_THAT(failures.texts(), IsEmpty());
}

TEST_F(CLQueriesTest, ThreeGigabytesAre3072Megabytes)
{
    EXPECT_EQ(impl.GetCLMemoryMB(), 3072U);
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 21, 4127, 8)"));
}

TEST_F(CLQueriesTest, MemoryBelowAMegabyteIsZero)
{
    answers()[CL_DEVICE_GLOBAL_MEM_SIZE] = CLValue(cl_ulong{1048575});
    EXPECT_EQ(impl.GetCLMemoryMB(), 0U);
}

TEST_F(CLQueriesTest, MegabytesBeyond32BitsAreTruncated)
{
    answers()[CL_DEVICE_GLOBAL_MEM_SIZE] = CLValue(~cl_ulong{0});
    EXPECT_EQ(impl.GetCLMemoryMB(), 0xFFFFFFFFU);
    answers()[CL_DEVICE_GLOBAL_MEM_SIZE] = CLValue((cl_ulong{1} << 52U) | (cl_ulong{5} << 20U));
    EXPECT_EQ(impl.GetCLMemoryMB(), 5U);
}

TEST_F(CLQueriesTest, VendorIdIsThePropertysValue)
{
    EXPECT_EQ(impl.GetCLVendorID(), 4098U);
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 21, 4097, 4)"));
}

TEST_F(CLQueriesTest, AFailedMemoryOrVendorIdThrowsTheLibrarysException)
{
    answers()[CL_DEVICE_GLOBAL_MEM_SIZE] = Failing();
    answers()[CL_DEVICE_VENDOR_ID] = Failing();
    EXPECT_THROW(impl.GetCLMemoryMB(), QGF::LogicalException);
    EXPECT_THROW(impl.GetCLVendorID(), QGF::LogicalException);
}

TEST_F(CLQueriesTest, DriverVersionQueriesItsSizeFirst)
{
    EXPECT_EQ(impl.GetCLDriverVersion(), "390.77");
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 21, 4141, 0)",
                                      "clGetDeviceInfo(device 21, 4141, 7)"));
}

TEST_F(CLQueriesTest, DriverVersionOfSizeZeroIsEmptyWithoutASecondCall)
{
    answers()[CL_DRIVER_VERSION] = CLAnswer{"", {}, CL_SUCCESS, CL_SUCCESS};
    EXPECT_EQ(impl.GetCLDriverVersion(), "");
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 21, 4141, 0)"));
}

TEST_F(CLQueriesTest, DriverVersionEndsAtTheFirstZeroByte)
{
    answers()[CL_DRIVER_VERSION] = CLText(std::string("1.0\0x", 5));
    EXPECT_EQ(impl.GetCLDriverVersion(), "1.0");
}

TEST_F(CLQueriesTest, UnterminatedDriverVersionIsRead)
{
    answers()[CL_DRIVER_VERSION] = CLAnswer{"1.0", {}, CL_SUCCESS, CL_SUCCESS};
    EXPECT_EQ(impl.GetCLDriverVersion(), "1.0");
}

TEST_F(CLQueriesTest, AFailureOfEitherCallForTheDriverVersionThrows)
{
    answers()[CL_DRIVER_VERSION].sizeStatus = CL_OUT_OF_RESOURCES;
    EXPECT_EQ(ErrorOf([&] { impl.GetCLDriverVersion(); }), "clGetDeviceInfo failed");
    answers()[CL_DRIVER_VERSION].sizeStatus = CL_SUCCESS;
    answers()[CL_DRIVER_VERSION].valueStatus = CL_OUT_OF_RESOURCES;
    EXPECT_EQ(ErrorOf([&] { impl.GetCLDriverVersion(); }), "clGetDeviceInfo failed");
    EXPECT_THAT(failures.texts(), ElementsAre("clGetDeviceInfo failed", "clGetDeviceInfo failed"));
}

TEST_F(CLQueriesTest, ALongDriverVersionIsReadWhole)
{
    answers()[CL_DRIVER_VERSION] = CLText(std::string(3 * 1024 * 1024, 'x'));
    EXPECT_EQ(impl.GetCLDriverVersion().size(), 3U * 1024 * 1024);
}

TEST_F(CLQueriesTest, ADriverVersionTooLongToAllocateThrowsBadAlloc)
{
    for (const std::size_t claimed : {kHalfOfAddressSpace, ~std::size_t{0}}) {
        cl.calls.clear();
        answers()[CL_DRIVER_VERSION].claimed = claimed;
        EXPECT_THROW(impl.GetCLDriverVersion(), std::bad_alloc) << claimed;
        EXPECT_EQ(cl.calls.size(), 1U);
    }
    EXPECT_THAT(failures.texts(), IsEmpty());
}

TEST_F(CLQueriesTest, DeviceVersionLosesItsPrefix)
{
    EXPECT_EQ(impl.GetCLDeviceVersion(), "1.2 something");
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 21, 4143, 0)",
                                      "clGetDeviceInfo(device 21, 4143, 21)"));
}

TEST_F(CLQueriesTest, DeviceVersionLosesThePrefixAtItsStartOnly)
{
    const std::pair<const char*, const char*> rows[] = {
        {"1.2 OpenCL 1.1", "1.2 OpenCL 1.1"},
        {"OpenCL1.2", "OpenCL1.2"},
        {"opencl 1.2", "opencl 1.2"},
        {"OpenCL OpenCL 1.2", "OpenCL 1.2"},
        {"OpenCL ", ""},
        {"OpenCL", "OpenCL"},
        {"", ""},
    };
    for (const auto& [text, expected] : rows) {
        answers()[CL_DEVICE_VERSION] = CLText(text);
        EXPECT_EQ(impl.GetCLDeviceVersion(), expected) << text;
    }
}

TEST_F(CLQueriesTest, DeviceVersionEndsAtTheFirstZeroByte)
{
    answers()[CL_DEVICE_VERSION] = CLText(std::string("OpenCL 2.0\0x", 12));
    EXPECT_EQ(impl.GetCLDeviceVersion(), "2.0");
}

TEST_F(CLQueriesTest, UnterminatedDeviceVersionLosesItsLastByte)
{
    answers()[CL_DEVICE_VERSION] = CLAnswer{"OpenCL 2.0", {}, CL_SUCCESS, CL_SUCCESS};
    EXPECT_EQ(impl.GetCLDeviceVersion(), "2.");
}

TEST_F(CLQueriesTest, AFailureOfEitherCallForTheDeviceVersionThrows)
{
    answers()[CL_DEVICE_VERSION].sizeStatus = CL_OUT_OF_RESOURCES;
    EXPECT_EQ(ErrorOf([&] { impl.GetCLDeviceVersion(); }),
              "Failed requirement: status == CL_SUCCESS");
    answers()[CL_DEVICE_VERSION].sizeStatus = CL_SUCCESS;
    answers()[CL_DEVICE_VERSION].valueStatus = CL_OUT_OF_RESOURCES;
    EXPECT_EQ(ErrorOf([&] { impl.GetCLDeviceVersion(); }),
              "Failed requirement: status == CL_SUCCESS");
    EXPECT_THAT(failures.texts(), ElementsAre("Failed requirement: status == CL_SUCCESS",
                                              "Failed requirement: status == CL_SUCCESS"));
}

TEST_F(CLQueriesTest, ALongDeviceVersionIsReadWhole)
{
    answers()[CL_DEVICE_VERSION] = CLText("OpenCL " + std::string(3 * 1024 * 1024, 'x'));
    EXPECT_EQ(impl.GetCLDeviceVersion().size(), 3U * 1024 * 1024);
}

TEST_F(CLQueriesTest, ADeviceVersionTooLongToAllocateThrowsBadAlloc)
{
    // A size of 0 wraps around, since the length is one byte less.
    for (const std::size_t claimed : {std::size_t{0}, kHalfOfAddressSpace, ~std::size_t{0}}) {
        cl.calls.clear();
        answers()[CL_DEVICE_VERSION].claimed = claimed;
        EXPECT_THROW(impl.GetCLDeviceVersion(), std::bad_alloc) << claimed;
        EXPECT_EQ(cl.calls.size(), 1U) << claimed;
    }
    EXPECT_THAT(failures.texts(), IsEmpty());
}

struct VersionRow {
    const char* text;
    const char* platformVersion;
    const char* cudaVersion;
};

// The version text of a platform and its two parts.
const VersionRow kVersionRows[] = {
    {"OpenCL 1.2 CUDA 8.0.0", "1.2", "8.0.0"},
    {"OpenCL 1.2 some platform", "1.2 some platform", ""},
    {"OpenCL 1.2 CUDA ", "1.2", ""},
    {"OpenCL 1.2 CUDA", "1.2 CUDA", ""},
    {"OpenCL 1.2 CUDA 8 CUDA 9", "1.2", "8 CUDA 9"},
    {"OpenCL 1.2 CUDA  CUDA 9", "1.2", " CUDA 9"},
    {"1.2 CUDA 8.0.0", "1.2", "8.0.0"},
    {"1.2 OpenCL 3", "1.2 OpenCL 3", ""},
    {"Version OpenCL 1.2 CUDA 7", "Version OpenCL 1.2", "7"},
    {"OpenCL  CUDA 8", "", "8"},
    {"OpenCL CUDA 8", "CUDA 8", ""},
    {"OpenCL 1.2 cuda 8", "1.2 cuda 8", ""},
    {"OpenCL 1.2 CUDA\t8", "1.2 CUDA\t8", ""},
    {"", "", ""},
};

TEST_F(CLQueriesTest, PlatformVersionIsSplitAtTheFirstCUDA)
{
    for (const VersionRow& row : kVersionRows) {
        SetPlatformVersion(row.text);
        EXPECT_EQ(impl.GetCLPlatformVersion(), row.platformVersion) << row.text;
        EXPECT_EQ(impl.GetCUDAVersion(), row.cudaVersion) << row.text;
        EXPECT_EQ(impl.GetCUDASupported(), *row.cudaVersion != '\0') << row.text;
    }
}

TEST_F(CLQueriesTest, PlatformVersionEndsAtTheFirstZeroByte)
{
    SetPlatformVersion(std::string("OpenCL 1.2\0 CUDA 8", 18));
    EXPECT_EQ(impl.GetCLPlatformVersion(), "1.2");
    EXPECT_FALSE(impl.GetCUDASupported());
}

TEST_F(CLQueriesTest, VersionsComeFromTheDevicesPlatform)
{
    EXPECT_EQ(impl.GetCUDAVersion(), "8.0.0");
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 21, 4145, 8)",
                                      "clGetPlatformInfo(platform 7, 2305, 0)",
                                      "clGetPlatformInfo(platform 7, 2305, 22)"));
}

TEST_F(CLQueriesTest, AFailedPlatformThrowsTheLibrarysException)
{
    answers()[CL_DEVICE_PLATFORM] = Failing();
    EXPECT_THROW(impl.GetCLPlatformVersion(), QGF::LogicalException);
    EXPECT_THROW(impl.GetCUDAVersion(), QGF::LogicalException);
    EXPECT_THROW(impl.GetCUDASupported(), QGF::LogicalException);
}

TEST_F(CLQueriesTest, SharedMemoryMeansIntegrated)
{
    EXPECT_TRUE(impl.IsIntegratedCLGPU());
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 21, 4149, 4)"));
    answers()[CL_DEVICE_HOST_UNIFIED_MEMORY] = CLValue(cl_bool{CL_FALSE});
    EXPECT_FALSE(impl.IsIntegratedCLGPU());
    answers()[CL_DEVICE_HOST_UNIFIED_MEMORY] = CLValue(cl_bool{2});
    EXPECT_TRUE(impl.IsIntegratedCLGPU());
}

TEST_F(CLQueriesTest, AFailedIntegratedQueryIsFalseAndNotReported)
{
    answers()[CL_DEVICE_HOST_UNIFIED_MEMORY] = Failing();
    EXPECT_FALSE(impl.IsIntegratedCLGPU());
    for (const cl_int status : {CL_INVALID_VALUE, 1}) {
        answers()[CL_DEVICE_HOST_UNIFIED_MEMORY] =
            CLValue(cl_bool{CL_TRUE}); // the failed call writes it
        answers()[CL_DEVICE_HOST_UNIFIED_MEMORY].valueStatus = status;
        EXPECT_FALSE(impl.IsIntegratedCLGPU()) << status;
    }
    EXPECT_THAT(failures.texts(), IsEmpty());
}

// Every status but 0 is a failure, not only the negative ones.
TEST_F(CLQueriesTest, APositiveStatusIsAFailureToo)
{
    for (const bool ofSize : {true, false}) {
        for (auto& [property, answer] : answers())
            (ofSize ? answer.sizeStatus : answer.valueStatus) = 1;
        EXPECT_EQ(ErrorOf([&] { impl.GetCLDriverVersion(); }), "clGetDeviceInfo failed");
        EXPECT_EQ(ErrorOf([&] { impl.GetCLDeviceVersion(); }),
                  "Failed requirement: status == CL_SUCCESS");
        EXPECT_THROW(impl.GetCLName(), QGF::LogicalException);
        EXPECT_THROW(impl.GetCLVendor(), QGF::LogicalException);
        for (auto& [property, answer] : answers())
            answer.sizeStatus = CL_SUCCESS;
    }
    EXPECT_THROW(impl.GetCLMemoryMB(), QGF::LogicalException);
    EXPECT_THROW(impl.GetCLVendorID(), QGF::LogicalException);
    EXPECT_THROW(impl.GetCLPlatformVersion(), QGF::LogicalException);
}

TEST_F(CLQueriesTest, TheReservedValueIsZero)
{
    EXPECT_EQ(impl.GetCLReserved(), 0U);
    EXPECT_THAT(cl.calls, IsEmpty());
}

TEST_F(CLQueriesTest, ResultsAreNotCached)
{
    EXPECT_EQ(impl.GetCLName(), "Some device");
    answers()[CL_DEVICE_NAME] = CLText("Another");
    EXPECT_EQ(impl.GetCLName(), "Another");
}

class CLEnumerationTest : public testing::Test {
protected:
    static assay_test::CLFakeDevice MakeDevice(std::uintptr_t id, cl_device_type type,
                                               const std::string& name)
    {
        return {id, type, {{CL_DEVICE_NAME, CLText(name)}}};
    }

    FakeOpenCL cl;
    GPUImplWin factory;
};

TEST_F(CLEnumerationTest, NoPlatformIsAnEmptyList)
{
    cl.platformsStatus = -1001;
    EXPECT_THAT(factory.GetCLGPUs(), IsEmpty());
}

TEST_F(CLEnumerationTest, APlatformWithoutGPUsContributesNothing)
{
    cl.platforms = {{1,
                     {},
                     {MakeDevice(1, CL_DEVICE_TYPE_CPU, "cpu"),
                      MakeDevice(2, CL_DEVICE_TYPE_ACCELERATOR, "accelerator")},
                     CL_SUCCESS,
                     {}}};
    EXPECT_THAT(factory.GetCLGPUs(), IsEmpty());
    EXPECT_THAT(cl.calls, ElementsAre("clGetPlatformIDs(0)", "clGetPlatformIDs(1)",
                                      "clGetDeviceIDs(platform 1, 4, 0)"));
}

TEST_F(CLEnumerationTest, RecordsComeInPlatformOrderWithAnImplementationEach)
{
    cl.platforms = {
        {1,
         {},
         {MakeDevice(1, CL_DEVICE_TYPE_GPU, "a"), MakeDevice(2, CL_DEVICE_TYPE_CPU, "b"),
          MakeDevice(3, CL_DEVICE_TYPE_GPU, "c")},
         CL_SUCCESS,
         {}},
        {2, {}, {MakeDevice(4, CL_DEVICE_TYPE_GPU, "d")}, CL_SUCCESS, {}}};
    const pmutil::GPUImpl::CLGPUs gpus = factory.GetCLGPUs();
    ASSERT_EQ(gpus.size(), 3U);
    EXPECT_EQ(gpus[0]->GetName(), "a");
    EXPECT_EQ(gpus[1]->GetName(), "c");
    EXPECT_EQ(gpus[2]->GetName(), "d");
    EXPECT_NE(gpus[0]->impl, gpus[1]->impl);
    EXPECT_NE(gpus[1]->impl, gpus[2]->impl);
    for (const auto& gpu : gpus) {
        auto* const impl = dynamic_cast<GPUImplWin*>(gpu->impl.get());
        ASSERT_NE(impl, nullptr);
        EXPECT_EQ(impl->context, nullptr);
    }
}

TEST_F(CLEnumerationTest, RecordsHaveNoAdapterData)
{
    cl.platforms = {{1, {}, {MakeDevice(1, CL_DEVICE_TYPE_GPU, "a")}, CL_SUCCESS, {}}};
    const pmutil::GPUImpl::CLGPUs gpus = factory.GetCLGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_EQ(gpus[0]->impl->GetGLDriver(), "");
    EXPECT_EQ(gpus[0]->impl->GetGLDriverDate(), "");
    EXPECT_EQ(gpus[0]->impl->GetGLDriverExtra(), "");
}

// Also if the factory has a context.
TEST(CLEnumerationDeathTest, AnOpenGLQueryOfARecordFailsTheAssertion)
{
    FakeOpenCL cl;
    cl.platforms = {{1, {}, {{1, CL_DEVICE_TYPE_GPU, {}}}, CL_SUCCESS, {}}};
    const assay_test::FakeOpenGL gl;
    GPUImplWin factory;
    factory.context = boost::make_shared<QGF::OGL::ContextOffscreen>(gl.devices[0].key);
    const pmutil::GPUImpl::CLGPUs gpus = factory.GetCLGPUs();
    ASSERT_EQ(gpus.size(), 1U);
    EXPECT_DEATH(gpus[0]->impl->GetGLVersion(), "px != 0");
    EXPECT_DEATH(gpus[0]->impl->GetGLVendor(), "px != 0");
    EXPECT_DEATH(gpus[0]->impl->HasGLNPOTSupport(), "px != 0");
}

TEST_F(CLEnumerationTest, TheFactoryGetsNoDevice)
{
    cl.platforms = {{1, {}, {MakeDevice(1, CL_DEVICE_TYPE_GPU, "a")}, CL_SUCCESS, {}}};
    factory.GetCLGPUs();
    EXPECT_EQ(factory.device.id(), nullptr);
}

TEST_F(CLEnumerationTest, AFailureOfOnePlatformThrows)
{
    cl.platforms = {{1, {}, {MakeDevice(1, CL_DEVICE_TYPE_GPU, "a")}, CL_SUCCESS, {}},
                    {2, {}, {}, CL_OUT_OF_HOST_MEMORY, {}}};
    EXPECT_THROW(factory.GetCLGPUs(), QGF::LogicalException);
}

} // namespace
