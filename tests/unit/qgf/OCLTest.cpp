#include "qgf/OCL.h"

#include <cstdint>
#include <cstring>
#include <new>
#include <numeric>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "qgf/qgf_ocl/Status.h"
#include "support/FakeOpenCL.h"

namespace {

using assay_test::CLAnswer;
using assay_test::CLText;
using assay_test::CLValue;
using assay_test::FakeOpenCL;
using QGF::OCL::Device;
using QGF::OCL::DeviceProperty;
using QGF::OCL::Platform;
using testing::ElementsAre;
using testing::IsEmpty;

// Bytes; larger than any object.
constexpr std::size_t kHalfOfAddressSpace = std::size_t{1} << 63U;

// The text of the LogicalException that `action` throws; empty if it throws none.
template <typename Action>
std::string FailureOf(const Action& action)
{
    try {
        action();
    } catch (const QGF::LogicalException& e) {
        return e.what();
    }
    return {};
}

class OCLTest : public testing::Test {
protected:
    OCLTest()
    {
        cl.platforms = {{11,
                         {{CL_PLATFORM_VERSION, CLText("OpenCL 1.2 First")}},
                         {{101,
                           CL_DEVICE_TYPE_GPU,
                           {{CL_DEVICE_NAME, CLText("First device")},
                            {CL_DEVICE_VENDOR, CLText("First vendor")},
                            {CL_DEVICE_PLATFORM, CLValue(std::uintptr_t{11})},
                            {CL_DEVICE_VENDOR_ID, CLValue(cl_uint{0x10DE})},
                            {CL_DEVICE_GLOBAL_MEM_SIZE, CLValue(cl_ulong{3} << 30U)}}},
                          {102, CL_DEVICE_TYPE_CPU, {}},
                          {103, CL_DEVICE_TYPE_GPU, {}}},
                         CL_SUCCESS,
                         {}},
                        {12, {}, {{104, CL_DEVICE_TYPE_CPU, {}}}, CL_SUCCESS, {}}};
    }

    std::map<cl_device_info, CLAnswer>& answers() { return cl.platforms[0].devices[0].answers; }

    FakeOpenCL cl;
    Device device{FakeOpenCL::DeviceID(101)};
    Platform platform{FakeOpenCL::PlatformID(11)};
};

TEST_F(OCLTest, ListsPlatformsInTheLoadersOrder)
{
    const std::vector<Platform> found = QGF::OCL::platforms();
    ASSERT_EQ(found.size(), 2U);
    EXPECT_EQ(found[0].id(), platform.id());
    EXPECT_EQ(found[1].handle(), FakeOpenCL::PlatformID(12));
    EXPECT_THAT(cl.calls, ElementsAre("clGetPlatformIDs(0)", "clGetPlatformIDs(2)"));
}

TEST_F(OCLTest, NoPlatformIsAnEmptyList)
{
    cl.platformsStatus = -1001;
    EXPECT_THAT(QGF::OCL::platforms(), IsEmpty());
    EXPECT_THAT(cl.calls, ElementsAre("clGetPlatformIDs(0)"));
}

TEST_F(OCLTest, ACountOfZeroPlatformsIsAnEmptyList)
{
    cl.platforms.clear();
    EXPECT_THAT(QGF::OCL::platforms(), IsEmpty());
}

TEST_F(OCLTest, OtherStatusOfTheLoaderThrows)
{
    cl.platformsStatus = CL_OUT_OF_HOST_MEMORY;
    EXPECT_EQ(FailureOf([] { QGF::OCL::platforms(); }),
              "clGetPlatformIDs failed: CL_OUT_OF_HOST_MEMORY (-6)");
}

TEST_F(OCLTest, FailureOfTheSecondPlatformCallThrows)
{
    cl.failing[1] = -1001;
    EXPECT_EQ(FailureOf([] { QGF::OCL::platforms(); }),
              "clGetPlatformIDs failed: CL_PLATFORM_NOT_FOUND_KHR (-1001)");
}

TEST_F(OCLTest, TooManyPlatformsThrow)
{
    cl.claimedPlatforms = 4097;
    EXPECT_EQ(FailureOf([] { QGF::OCL::platforms(); }),
              "clGetPlatformIDs: the driver reports a list of 4097 entries");
    EXPECT_THAT(cl.calls, ElementsAre("clGetPlatformIDs(0)"));
}

TEST_F(OCLTest, PlatformsReportedButNotReturnedAreLeftOut)
{
    cl.claimedPlatforms = 4096;
    EXPECT_EQ(QGF::OCL::platforms().size(), 2U);
}

TEST_F(OCLTest, ListsDevicesOfOneTypeInThePlatformsOrder)
{
    const std::vector<Device> found = platform.devices(CL_DEVICE_TYPE_GPU);
    ASSERT_EQ(found.size(), 2U);
    EXPECT_EQ(found[0].id(), FakeOpenCL::DeviceID(101));
    EXPECT_EQ(found[1].id(), FakeOpenCL::DeviceID(103));
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceIDs(platform 11, 4, 0)",
                                      "clGetDeviceIDs(platform 11, 4, 2)"));
}

TEST_F(OCLTest, DeviceNotFoundIsAnEmptyList)
{
    EXPECT_THAT(QGF::OCL::platforms()[1].devices(CL_DEVICE_TYPE_GPU), IsEmpty());
}

TEST_F(OCLTest, OtherStatusOfAPlatformThrows)
{
    cl.platforms[0].devicesStatus = CL_INVALID_PLATFORM;
    EXPECT_EQ(FailureOf([&] { platform.devices(CL_DEVICE_TYPE_GPU); }),
              "clGetDeviceIDs failed: CL_INVALID_PLATFORM (-32)");
}

TEST_F(OCLTest, UnknownStatusIsReportedByItsNumber)
{
    for (const cl_int status : {-9999, -20, -29, -73, -1000, -1002, 1, 5}) {
        cl.platforms[0].devicesStatus = status;
        EXPECT_EQ(FailureOf([&] { platform.devices(CL_DEVICE_TYPE_GPU); }),
                  "clGetDeviceIDs failed: unknown status (" + std::to_string(status) + ")");
    }
}

TEST_F(OCLTest, KnownStatusIsReportedByItsName)
{
    const std::pair<cl_int, const char*> rows[] = {
        {-1, "CL_DEVICE_NOT_FOUND"},
        {-2, "CL_DEVICE_NOT_AVAILABLE"},
        {-3, "CL_COMPILER_NOT_AVAILABLE"},
        {-4, "CL_MEM_OBJECT_ALLOCATION_FAILURE"},
        {-5, "CL_OUT_OF_RESOURCES"},
        {-6, "CL_OUT_OF_HOST_MEMORY"},
        {-7, "CL_PROFILING_INFO_NOT_AVAILABLE"},
        {-8, "CL_MEM_COPY_OVERLAP"},
        {-9, "CL_IMAGE_FORMAT_MISMATCH"},
        {-10, "CL_IMAGE_FORMAT_NOT_SUPPORTED"},
        {-11, "CL_BUILD_PROGRAM_FAILURE"},
        {-12, "CL_MAP_FAILURE"},
        {-13, "CL_MISALIGNED_SUB_BUFFER_OFFSET"},
        {-14, "CL_EXEC_STATUS_ERROR_FOR_EVENTS_IN_WAIT_LIST"},
        {-15, "CL_COMPILE_PROGRAM_FAILURE"},
        {-16, "CL_LINKER_NOT_AVAILABLE"},
        {-17, "CL_LINK_PROGRAM_FAILURE"},
        {-18, "CL_DEVICE_PARTITION_FAILED"},
        {-19, "CL_KERNEL_ARG_INFO_NOT_AVAILABLE"},
        {-30, "CL_INVALID_VALUE"},
        {-31, "CL_INVALID_DEVICE_TYPE"},
        {-32, "CL_INVALID_PLATFORM"},
        {-33, "CL_INVALID_DEVICE"},
        {-34, "CL_INVALID_CONTEXT"},
        {-35, "CL_INVALID_QUEUE_PROPERTIES"},
        {-36, "CL_INVALID_COMMAND_QUEUE"},
        {-37, "CL_INVALID_HOST_PTR"},
        {-38, "CL_INVALID_MEM_OBJECT"},
        {-39, "CL_INVALID_IMAGE_FORMAT_DESCRIPTOR"},
        {-40, "CL_INVALID_IMAGE_SIZE"},
        {-41, "CL_INVALID_SAMPLER"},
        {-42, "CL_INVALID_BINARY"},
        {-43, "CL_INVALID_BUILD_OPTIONS"},
        {-44, "CL_INVALID_PROGRAM"},
        {-45, "CL_INVALID_PROGRAM_EXECUTABLE"},
        {-46, "CL_INVALID_KERNEL_NAME"},
        {-47, "CL_INVALID_KERNEL_DEFINITION"},
        {-48, "CL_INVALID_KERNEL"},
        {-49, "CL_INVALID_ARG_INDEX"},
        {-50, "CL_INVALID_ARG_VALUE"},
        {-51, "CL_INVALID_ARG_SIZE"},
        {-52, "CL_INVALID_KERNEL_ARGS"},
        {-53, "CL_INVALID_WORK_DIMENSION"},
        {-54, "CL_INVALID_WORK_GROUP_SIZE"},
        {-55, "CL_INVALID_WORK_ITEM_SIZE"},
        {-56, "CL_INVALID_GLOBAL_OFFSET"},
        {-57, "CL_INVALID_EVENT_WAIT_LIST"},
        {-58, "CL_INVALID_EVENT"},
        {-59, "CL_INVALID_OPERATION"},
        {-60, "CL_INVALID_GL_OBJECT"},
        {-61, "CL_INVALID_BUFFER_SIZE"},
        {-62, "CL_INVALID_MIP_LEVEL"},
        {-63, "CL_INVALID_GLOBAL_WORK_SIZE"},
        {-64, "CL_INVALID_PROPERTY"},
        {-65, "CL_INVALID_IMAGE_DESCRIPTOR"},
        {-66, "CL_INVALID_COMPILER_OPTIONS"},
        {-67, "CL_INVALID_LINKER_OPTIONS"},
        {-68, "CL_INVALID_DEVICE_PARTITION_COUNT"},
        {-69, "CL_INVALID_PIPE_SIZE"},
        {-70, "CL_INVALID_DEVICE_QUEUE"},
        {-71, "CL_INVALID_SPEC_ID"},
        {-72, "CL_MAX_SIZE_RESTRICTION_EXCEEDED"},
        {-1001, "CL_PLATFORM_NOT_FOUND_KHR"},
    };
    for (const auto& [status, name] : rows) {
        if (status == CL_DEVICE_NOT_FOUND) // an empty list, not a failure
            continue;
        cl.platforms[0].devicesStatus = status;
        EXPECT_EQ(FailureOf([&] { platform.devices(CL_DEVICE_TYPE_GPU); }),
                  std::string("clGetDeviceIDs failed: ") + name + " (" + std::to_string(status) +
                      ")");
    }
    answers()[CL_DEVICE_NAME].sizeStatus = CL_DEVICE_NOT_FOUND;
    EXPECT_EQ(FailureOf([&] { device.name(); }),
              "clGetDeviceInfo(CL_DEVICE_NAME) failed: CL_DEVICE_NOT_FOUND (-1)");
    EXPECT_STREQ(QGF::OCL::StatusName(CL_SUCCESS), "CL_SUCCESS");
}

TEST_F(OCLTest, TooManyDevicesThrow)
{
    cl.platforms[0].claimedDevices = 0xFFFFFFFFU;
    EXPECT_EQ(FailureOf([&] { platform.devices(CL_DEVICE_TYPE_GPU); }),
              "clGetDeviceIDs: the driver reports a list of 4294967295 entries");
}

TEST_F(OCLTest, DevicesReportedButNotReturnedAreLeftOut)
{
    cl.platforms[0].claimedDevices = 9;
    EXPECT_EQ(platform.devices(CL_DEVICE_TYPE_GPU).size(), 2U);
}

TEST_F(OCLTest, ANullDeviceIdFailsItsOwnQueriesOnly)
{
    cl.platforms[0].devices[0].id = 0;
    const std::vector<Device> found = platform.devices(CL_DEVICE_TYPE_GPU);
    ASSERT_EQ(found.size(), 2U);
    EXPECT_EQ(FailureOf([&] { (void)found[0].name(); }),
              "clGetDeviceInfo(CL_DEVICE_NAME) failed: CL_INVALID_DEVICE (-33)");
}

TEST_F(OCLTest, PlatformVersionIsTheDriversText)
{
    EXPECT_EQ(platform.version(), "OpenCL 1.2 First");
}

TEST_F(OCLTest, FailedPlatformVersionThrows)
{
    EXPECT_EQ(FailureOf([] { (void)QGF::OCL::platforms()[1].version(); }),
              "clGetPlatformInfo(CL_PLATFORM_VERSION) failed: CL_INVALID_VALUE (-30)");
}

TEST_F(OCLTest, DeviceTextsAreTheDriversTexts)
{
    EXPECT_EQ(device.name(), "First device");
    EXPECT_EQ(device.vendor(), "First vendor");
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 101, 4139, 0)",
                                      "clGetDeviceInfo(device 101, 4139, 13)",
                                      "clGetDeviceInfo(device 101, 4140, 0)",
                                      "clGetDeviceInfo(device 101, 4140, 13)"));
}

TEST_F(OCLTest, ATextEndsAtItsFirstZeroByte)
{
    answers()[CL_DEVICE_NAME] = CLText(std::string("a\0b", 3));
    EXPECT_EQ(device.name(), "a");
}

TEST_F(OCLTest, AnUnterminatedTextHasTheReportedSize)
{
    answers()[CL_DEVICE_NAME] = CLAnswer{"abc", {}, CL_SUCCESS, CL_SUCCESS};
    EXPECT_EQ(device.name(), "abc");
}

TEST_F(OCLTest, ATextOfNoBytesIsEmptyWithoutASecondCall)
{
    answers()[CL_DEVICE_NAME] = CLAnswer{"", {}, CL_SUCCESS, CL_SUCCESS};
    EXPECT_EQ(device.name(), "");
    EXPECT_EQ(cl.calls.size(), 1U);
}

TEST_F(OCLTest, ALongTextIsReadWhole)
{
    answers()[CL_DEVICE_NAME] = CLText(std::string(3 * 1024 * 1024, 'x'));
    EXPECT_EQ(device.name().size(), 3U * 1024 * 1024);
}

TEST_F(OCLTest, ATextShorterThanItsReportedSizeEndsAtItsZeroByte)
{
    answers()[CL_DEVICE_NAME] = CLAnswer{"abc", 1024 * 1024, CL_SUCCESS, CL_SUCCESS};
    EXPECT_EQ(device.name(), "abc");
}

TEST_F(OCLTest, ATextTooLongToAllocateThrowsBadAlloc)
{
    for (const std::size_t claim : {kHalfOfAddressSpace, ~std::size_t{0}}) {
        cl.calls.clear();
        answers()[CL_DEVICE_VENDOR] = CLAnswer{"x", claim, CL_SUCCESS, CL_SUCCESS};
        EXPECT_THROW((void)device.vendor(), std::bad_alloc) << claim;
        EXPECT_EQ(cl.calls.size(), 1U);
    }
}

TEST_F(OCLTest, AFailureOfEitherCallForATextThrows)
{
    answers()[CL_DEVICE_NAME].sizeStatus = CL_OUT_OF_RESOURCES;
    EXPECT_EQ(FailureOf([&] { (void)device.name(); }),
              "clGetDeviceInfo(CL_DEVICE_NAME) failed: CL_OUT_OF_RESOURCES (-5)");
    answers()[CL_DEVICE_NAME].sizeStatus = CL_SUCCESS;
    answers()[CL_DEVICE_NAME].valueStatus = CL_OUT_OF_RESOURCES;
    EXPECT_EQ(FailureOf([&] { (void)device.name(); }),
              "clGetDeviceInfo(CL_DEVICE_NAME) failed: CL_OUT_OF_RESOURCES (-5)");
}

TEST_F(OCLTest, ADeviceKnowsItsPlatform)
{
    EXPECT_EQ(device.platform().id(), platform.id());
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 101, 4145, 8)"));
}

TEST_F(OCLTest, ANullPlatformOfADeviceThrows)
{
    answers()[CL_DEVICE_PLATFORM] = CLValue(std::uintptr_t{0});
    EXPECT_EQ(FailureOf([&] { (void)device.platform(); }),
              "clGetDeviceInfo(CL_DEVICE_PLATFORM): the driver returns no platform");
}

TEST_F(OCLTest, PropertyTypesHaveTheNamesOfTheirCTypes)
{
    EXPECT_STREQ(QGF::OCL::Enum::GetPropertyTypeName(DeviceProperty::VendorID), "cl_uint");
    EXPECT_STREQ(QGF::OCL::Enum::GetPropertyTypeName(DeviceProperty::GlobalMemSize), "cl_ulong");
    EXPECT_STREQ(QGF::OCL::Enum::GetPropertyTypeName(static_cast<DeviceProperty>(0x1000)), "");
}

TEST_F(OCLTest, TypedReadReturnsTheValue)
{
    EXPECT_EQ(device.getInfo<cl_uint>(DeviceProperty::VendorID), 0x10DEU);
    EXPECT_EQ(device.getInfo<cl_ulong>(DeviceProperty::GlobalMemSize), 3221225472U);
    EXPECT_THAT(cl.calls, ElementsAre("clGetDeviceInfo(device 101, 4097, 4)",
                                      "clGetDeviceInfo(device 101, 4127, 8)"));
}

TEST_F(OCLTest, TypedReadOfAnotherTypeThrowsInternalException)
{
    try {
        (void)device.getInfo<cl_ulong>(DeviceProperty::VendorID);
        FAIL() << "nothing was thrown";
    } catch (const QGF::InternalException& e) {
        EXPECT_STREQ(e.file(), "qgf/source/qgf/qgf_ocl/Device");
        EXPECT_EQ(e.line(), 122);
        EXPECT_STREQ(e.text(), "property_typename == type_name");
    }
    EXPECT_THAT(cl.calls, IsEmpty());
}

TEST_F(OCLTest, AValueOfAnotherSizeThrows)
{
    answers()[CL_DEVICE_VENDOR_ID] = CLValue(cl_ulong{1});
    EXPECT_EQ(FailureOf([&] { (void)device.getInfo<cl_uint>(DeviceProperty::VendorID); }),
              "clGetDeviceInfo(CL_DEVICE_VENDOR_ID): the driver returns 8 bytes instead of 4");
}

TEST_F(OCLTest, GetInfoImplReturnsTheActualSize)
{
    cl_uint vendor = 0;
    std::size_t actual = 0;
    device.getInfoImpl(DeviceProperty::VendorID, sizeof vendor, &vendor, &actual);
    EXPECT_EQ(actual, 4U);
    EXPECT_EQ(vendor, 0x10DEU);
}

TEST_F(OCLTest, AFailedValueThrows)
{
    answers()[CL_DEVICE_GLOBAL_MEM_SIZE].valueStatus = CL_INVALID_DEVICE;
    EXPECT_EQ(FailureOf([&] { (void)device.getInfo<cl_ulong>(DeviceProperty::GlobalMemSize); }),
              "clGetDeviceInfo(CL_DEVICE_GLOBAL_MEM_SIZE) failed: CL_INVALID_DEVICE (-33)");
    answers()[0x1000].valueStatus = CL_INVALID_VALUE;
    cl_uint other = 0;
    EXPECT_EQ(FailureOf([&] {
                  device.getInfoImpl(static_cast<DeviceProperty>(0x1000), sizeof other, &other,
                                     nullptr);
              }),
              "clGetDeviceInfo failed: CL_INVALID_VALUE (-30)");
}

TEST_F(OCLTest, ContextAndQueueAreReleasedInReverseOrder)
{
    {
        const QGF::OCL::ContextProperties properties(platform);
        const QGF::OCL::Context context(properties, device, {});
        const QGF::OCL::CommandQueue queue(context, device, false, true);
    }
    EXPECT_THAT(cl.calls,
                ElementsAre("clCreateContext(4228=11, device 101, null, null)",
                            "clCreateCommandQueue(context 1, device 101, 2)",
                            "clReleaseCommandQueue(queue 1)", "clReleaseContext(context 1)"));
}

TEST_F(OCLTest, AFailedContextThrowsAndReleasesNothing)
{
    cl.failing[0] = CL_DEVICE_NOT_AVAILABLE;
    const QGF::OCL::ContextProperties properties(platform);
    EXPECT_EQ(FailureOf([&] { const QGF::OCL::Context context(properties, device, {}); }),
              "clCreateContext failed: CL_DEVICE_NOT_AVAILABLE (-2)");
    EXPECT_EQ(cl.calls.size(), 1U);
}

TEST_F(OCLTest, AFailedQueueThrowsAndReleasesTheContext)
{
    cl.failing[1] = CL_INVALID_QUEUE_PROPERTIES;
    EXPECT_EQ(FailureOf([&] {
                  const QGF::OCL::ContextProperties properties(platform);
                  const QGF::OCL::Context context(properties, device, {});
                  const QGF::OCL::CommandQueue queue(context, device, true, false);
              }),
              "clCreateCommandQueue failed: CL_INVALID_QUEUE_PROPERTIES (-35)");
    EXPECT_THAT(cl.calls, ElementsAre("clCreateContext(4228=11, device 101, null, null)",
                                      "clCreateCommandQueue(context 1, device 101, 1)",
                                      "clReleaseContext(context 1)"));
}

TEST_F(OCLTest, AnExceptionOfAReleaseIsIgnored)
{
    cl.throwing = {"clReleaseCommandQueue", "clReleaseContext", "clReleaseEvent",
                   "clReleaseMemObject"};
    {
        const QGF::OCL::ContextProperties properties(platform);
        const QGF::OCL::Context context(properties, device, {});
        const QGF::OCL::CommandQueue queue(context, device, false, true);
        QGF::OCL::HandleTraits<cl_event>::Release(nullptr);
        QGF::OCL::HandleTraits<cl_mem>::Release(nullptr);
    }
    EXPECT_THAT(cl.calls,
                ElementsAre("clCreateContext(4228=11, device 101, null, null)",
                            "clCreateCommandQueue(context 1, device 101, 2)",
                            "clReleaseEvent(event 0)", "clReleaseMemObject(buffer 0)",
                            "clReleaseCommandQueue(queue 1)", "clReleaseContext(context 1)"));
}

// A library that has every entry point but one.
struct IncompleteLibrary {
    std::string missing;
    std::set<std::string> requested;
};

void Nothing() {}

QGF::Core::Proc GetIncompleteProc(void* context, const char* name)
{
    IncompleteLibrary& library = *static_cast<IncompleteLibrary*>(context);
    library.requested.insert(name);
    return library.missing == name ? nullptr : Nothing;
}

TEST(OCLFunctionTableTest, IsCompleteWithAllEntryPoints)
{
    IncompleteLibrary library;
    QGF::OCL::FunctionTable table{};
    EXPECT_TRUE(QGF::OCL::FillFunctionTable(table, GetIncompleteProc, &library));
    EXPECT_EQ(library.requested.size(), sizeof table / sizeof(QGF::Core::Proc));
}

QGF::Core::Proc GetNumberedProc(void* context, const char*)
{
    return reinterpret_cast<QGF::Core::Proc>(++*static_cast<std::uintptr_t*>(context));
}

TEST(OCLFunctionTableTest, RequestsItsMembersInTheirOrder)
{
    std::uintptr_t requested = 0;
    QGF::OCL::FunctionTable table{};
    QGF::OCL::FillFunctionTable(table, GetNumberedProc, &requested);
    std::vector<std::uintptr_t> members(sizeof table / sizeof(std::uintptr_t));
    std::memcpy(members.data(), &table, sizeof table);
    std::vector<std::uintptr_t> inOrder(requested);
    std::iota(inOrder.begin(), inOrder.end(), 1);
    EXPECT_EQ(members, inOrder);
}

// The entry points that the program calls.
const std::set<std::string> kCalled = {
    "clBuildProgram",      "clCreateBuffer",         "clCreateCommandQueue",
    "clCreateContext",     "clCreateKernel",         "clCreateProgramWithSource",
    "clEnqueueCopyBuffer", "clEnqueueNDRangeKernel", "clFinish",
    "clGetDeviceIDs",      "clGetDeviceInfo",        "clGetEventProfilingInfo",
    "clGetPlatformIDs",    "clGetPlatformInfo",      "clReleaseCommandQueue",
    "clReleaseContext",    "clReleaseEvent",         "clReleaseMemObject",
    "clSetKernelArg",      "clWaitForEvents",
};

TEST(OCLFunctionTableTest, IsIncompleteWithoutAnyCalledEntryPoint)
{
    IncompleteLibrary all;
    QGF::OCL::FunctionTable table{};
    QGF::OCL::FillFunctionTable(table, GetIncompleteProc, &all);
    for (const std::string& name : all.requested) {
        IncompleteLibrary library{name, {}};
        EXPECT_EQ(QGF::OCL::FillFunctionTable(table, GetIncompleteProc, &library),
                  kCalled.count(name) == 0)
            << name;
    }
}

TEST(OCLFunctionTableTest, FillsTheOthersWhenOneIsMissing)
{
    IncompleteLibrary library{"clGetPlatformIDs", {}};
    QGF::OCL::FunctionTable table{};
    QGF::OCL::FillFunctionTable(table, GetIncompleteProc, &library);
    EXPECT_EQ(table.clGetPlatformIDs, nullptr);
    EXPECT_NE(table.clFinish, nullptr);
    EXPECT_NE(table.clGetExtensionFunctionAddress.address, nullptr);
}

TEST(OCLLibraryTest, AMissingFileIsNotAvailable)
{
    EXPECT_FALSE(QGF::OCL::Library::IsOpenCLAvailable("no-such-library-anywhere"));
}

TEST(OCLLibraryTest, AnotherLibraryIsNotAvailable)
{
#if defined(_WIN32)
    EXPECT_FALSE(QGF::OCL::Library::IsOpenCLAvailable("kernel32.dll"));
#else
    EXPECT_FALSE(QGF::OCL::Library::IsOpenCLAvailable("libc.so.6"));
#endif
}

} // namespace
