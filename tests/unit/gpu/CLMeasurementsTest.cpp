// The two OpenCL measurements: their calls, log lines and results.
#include <cstdlib>
#include <initializer_list>
#include <memory>
#include <stdexcept>

#include <gmock/gmock.h>

#include "pmutil_gpu/GPUImplWin.h"
#include "support/Allocations.h"
#include "support/CapturedFailures.h"
#include "support/CapturedLog.h"
#include "support/FakeOpenCL.h"

namespace {

using assay_test::CapturedLog;
using assay_test::CLValue;
using assay_test::FakeOpenCL;
using testing::ElementsAreArray;
using testing::IsEmpty;
using testing::Pair;
using testing::UnorderedElementsAre;

using Lines = std::vector<std::string>;

constexpr char kRequirement[] = "Failed requirement: ciErrNum == CL_SUCCESS";

// Counters for batches of ten copies that take the given nanoseconds in all; the first copy takes
// all the time. Like those of real devices they don't begin at 0.
auto BatchesOf(cl_ulong nanoseconds)
{
    return [nanoseconds](int event) {
        const cl_ulong start = 1000000000000U;
        return std::pair<cl_ulong, cl_ulong>{start, start + (event % 10 == 1 ? nanoseconds : 0)};
    };
}

class CLMeasurementsTest : public testing::Test {
protected:
    CLMeasurementsTest()
    {
        cl.platforms = {
            {7,
             {},
             {{21, CL_DEVICE_TYPE_GPU, {{CL_DEVICE_PLATFORM, CLValue(std::uintptr_t{7})}}}},
             CL_SUCCESS,
             {}}};
        impl.device = QGF::OCL::Device(FakeOpenCL::DeviceID(21));
    }

    int CountCalls(const std::string& name) const
    {
        int count = 0;
        for (const std::string& call : cl.calls)
            count += call.compare(0, name.size() + 1, name + "(") == 0 ? 1 : 0;
        return count;
    }

    FakeOpenCL cl;
    assay_test::CapturedFailures failures;
    pmutil::GPUImplWin impl;
};

// The calls of a bandwidth measurement that ends after one batch.
const Lines kBandwidthCalls = {
    "clGetDeviceInfo(device 21, 4145, 8)",
    "clCreateContext(4228=7, device 21, null, null)",
    "clCreateCommandQueue(context 1, device 21, 2)",
    "clCreateBuffer(context 1, 4, 16777216, null)",
    "clCreateBuffer(context 1, 2, 16777216, null)",
    "clFinish(queue 1)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clEnqueueCopyBuffer(queue 1, buffer 1, buffer 2, 0, 0, 16777216, 0, null)",
    "clFinish(queue 1)",
    "clGetEventProfilingInfo(event 1, 4739, 8, null)",
    "clGetEventProfilingInfo(event 1, 4738, 8, null)",
    "clGetEventProfilingInfo(event 2, 4739, 8, null)",
    "clGetEventProfilingInfo(event 2, 4738, 8, null)",
    "clGetEventProfilingInfo(event 3, 4739, 8, null)",
    "clGetEventProfilingInfo(event 3, 4738, 8, null)",
    "clGetEventProfilingInfo(event 4, 4739, 8, null)",
    "clGetEventProfilingInfo(event 4, 4738, 8, null)",
    "clGetEventProfilingInfo(event 5, 4739, 8, null)",
    "clGetEventProfilingInfo(event 5, 4738, 8, null)",
    "clGetEventProfilingInfo(event 6, 4739, 8, null)",
    "clGetEventProfilingInfo(event 6, 4738, 8, null)",
    "clGetEventProfilingInfo(event 7, 4739, 8, null)",
    "clGetEventProfilingInfo(event 7, 4738, 8, null)",
    "clGetEventProfilingInfo(event 8, 4739, 8, null)",
    "clGetEventProfilingInfo(event 8, 4738, 8, null)",
    "clGetEventProfilingInfo(event 9, 4739, 8, null)",
    "clGetEventProfilingInfo(event 9, 4738, 8, null)",
    "clGetEventProfilingInfo(event 10, 4739, 8, null)",
    "clGetEventProfilingInfo(event 10, 4738, 8, null)",
    "clFinish(queue 1)",
    "clReleaseEvent(event 1)",
    "clReleaseEvent(event 2)",
    "clReleaseEvent(event 3)",
    "clReleaseEvent(event 4)",
    "clReleaseEvent(event 5)",
    "clReleaseEvent(event 6)",
    "clReleaseEvent(event 7)",
    "clReleaseEvent(event 8)",
    "clReleaseEvent(event 9)",
    "clReleaseEvent(event 10)",
    "clReleaseMemObject(buffer 1)",
    "clReleaseMemObject(buffer 2)",
    "clReleaseCommandQueue(queue 1)",
    "clReleaseContext(context 1)",
};

// The calls of a compute measurement.
const Lines kComputeCalls = {
    "clGetDeviceInfo(device 21, 4145, 8)",
    "clCreateContext(4228=7, device 21, null, null)",
    "clCreateCommandQueue(context 1, device 21, 2)",
    "clCreateProgramWithSource(context 1, 1, null)",
    "clBuildProgram(program 1, 0, null, null, null, null)",
    "clCreateKernel(program 1, justIterate)",
    "clCreateBuffer(context 1, 33, 4194304, given)",
    "clSetKernelArg(kernel 1, 0, 8)",
    "clSetKernelArg(kernel 1, 1, 4)",
    "clEnqueueNDRangeKernel(queue 1, kernel 1, 1, null, 1048576, 64, 0, null)",
    "clWaitForEvents(1, event 1)",
    "clGetEventProfilingInfo(event 1, 4739, 8, null)",
    "clGetEventProfilingInfo(event 1, 4738, 8, null)",
    "clFinish(queue 1)",
    "clReleaseMemObject(buffer 1)",
    "clReleaseCommandQueue(queue 1)",
    "clReleaseContext(context 1)",
};

// The calls that follow a failed call.
enum class After { Nothing, ReleaseContext, ReleaseQueueAndContext, Continues };

// The expected calls if the call with that index fails.
Lines CallsUpTo(const Lines& whole, std::size_t index, After after)
{
    if (after == After::Continues)
        return whole;
    Lines calls(whole.begin(), whole.begin() + static_cast<std::ptrdiff_t>(index) + 1);
    if (after == After::ReleaseQueueAndContext)
        calls.emplace_back("clReleaseCommandQueue(queue 1)");
    if (after != After::Nothing)
        calls.emplace_back("clReleaseContext(context 1)");
    return calls;
}

// By the index of the failed call in kBandwidthCalls.
After AfterBandwidthFailure(std::size_t index)
{
    if (index <= 1) // platform, context
        return After::Nothing;
    if (index == 2) // queue
        return After::ReleaseContext;
    if (index == 3 || index == 4) // buffers
        return After::ReleaseQueueAndContext;
    if (index >= 6 && index <= 15) // copies
        return After::ReleaseQueueAndContext;
    return After::Continues;
}

// By the index of the failed call in kComputeCalls.
After AfterComputeFailure(std::size_t index)
{
    if (index <= 1)
        return After::Nothing;
    if (index == 2)
        return After::ReleaseContext;
    if (index <= 10) // program, build, kernel, buffer, both arguments, run, wait
        return After::ReleaseQueueAndContext;
    return After::Continues;
}

TEST_F(CLMeasurementsTest, BandwidthMakesExactlyTheseCalls)
{
    cl.counters = BatchesOf(1000000000);
    EXPECT_EQ(impl.GetCLBandwidth(), 335544320.0);
    EXPECT_THAT(cl.calls, ElementsAreArray(kBandwidthCalls));
}

TEST_F(CLMeasurementsTest, BandwidthMakesTheSameCallsWithLoggingOn)
{
    const CapturedLog log(pmutil::gGPUAssay);
    cl.counters = BatchesOf(1000000000);
    impl.GetCLBandwidth();
    EXPECT_THAT(cl.calls, ElementsAreArray(kBandwidthCalls));
}

TEST_F(CLMeasurementsTest, BandwidthStopsOrContinuesAfterEachFailedCall)
{
    const std::pair<bool, cl_int> cases[] = {
        {false, CL_OUT_OF_RESOURCES}, {true, CL_OUT_OF_RESOURCES}, {false, 1}};
    for (const auto& [logging, status] : cases) {
        std::unique_ptr<CapturedLog> log;
        if (logging)
            log = std::make_unique<CapturedLog>(pmutil::gGPUAssay);
        for (std::size_t index = 0; index < kBandwidthCalls.size(); ++index) {
            SCOPED_TRACE(kBandwidthCalls[index]);
            const assay_test::CapturedFailures reported;
            cl.calls.clear();
            cl.created.clear();
            cl.counters = BatchesOf(1000000000);
            cl.failing = {{index, status}};
            const After after = AfterBandwidthFailure(index);
            if (index <= 2) {
                EXPECT_THROW(impl.GetCLBandwidth(), QGF::LogicalException);
            } else if (after == After::Continues) {
                EXPECT_NO_THROW(impl.GetCLBandwidth());
            } else {
                EXPECT_THROW(impl.GetCLBandwidth(), std::runtime_error);
                EXPECT_THAT(reported.texts(), testing::ElementsAre(kRequirement));
            }
            EXPECT_THAT(cl.calls, ElementsAreArray(CallsUpTo(kBandwidthCalls, index, after)));
        }
    }
}

TEST_F(CLMeasurementsTest, BatchesOfAFifthOfASecondAreFive)
{
    cl.counters = BatchesOf(200000000);
    EXPECT_EQ(impl.GetCLBandwidth(), 1677721600.0);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 50);
    EXPECT_EQ(CountCalls("clFinish"), 7);
}

// As doubles, ten copies of 0.02 s add up to slightly less than 0.2 s, and five such batches to
// slightly less than 1 s, so a sixth one runs. Sums of binary fractions are exact.
TEST_F(CLMeasurementsTest, EvenCopiesAddUpAsDoublesDo)
{
    const struct {
        cl_ulong nanoseconds; // of each copy
        double batch;         // in seconds
        int batches;
    } rows[] = {
        {10000000, 0.09999999999999999, 10}, {15625000, 0.15625, 7},
        {20000000, 0.19999999999999998, 6},  {50000000, 0.49999999999999994, 3},
        {100000000, 0.9999999999999999, 2},  {125000000, 1.25, 1},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.nanoseconds);
        cl.calls.clear();
        cl.counters = [&row](int) { return std::pair<cl_ulong, cl_ulong>{0, row.nanoseconds}; };
        EXPECT_EQ(impl.GetCLBandwidth(), 335544320.0 / row.batch);
        EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 10 * row.batches);
    }
}

TEST_F(CLMeasurementsTest, BatchesOfATenthOfASecondGive3355443200BytesPerSecond)
{
    cl.counters = BatchesOf(100000000);
    EXPECT_EQ(impl.GetCLBandwidth(), 3355443200.0);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 100);
}

TEST_F(CLMeasurementsTest, AFastDeviceRunsTenBatches)
{
    cl.counters = BatchesOf(1000000);
    EXPECT_DOUBLE_EQ(impl.GetCLBandwidth(), 335544320000.0);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 100);
}

TEST_F(CLMeasurementsTest, ASlowDeviceEndsAfterTheBatchThatExceedsTheSecond)
{
    cl.counters = BatchesOf(3000000000);
    EXPECT_DOUBLE_EQ(impl.GetCLBandwidth(), 335544320.0 / 3);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 10);
}

TEST_F(CLMeasurementsTest, ConstantCountersGiveZeroAfterTenBatches)
{
    const CapturedLog log(pmutil::gGPUAssay);
    cl.counters = [](int) { return std::pair<cl_ulong, cl_ulong>{5, 5}; };
    EXPECT_EQ(impl.GetCLBandwidth(), 0.0);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 100);
    for (const std::string& line : log.Lines())
        EXPECT_EQ(line.find("BW="), std::string::npos) << line;
}

TEST_F(CLMeasurementsTest, TheFastestBatchCounts)
{
    // 0.5 s, then 0.125 s, then 0.5 s.
    cl.counters = [](int event) {
        const cl_ulong batch[] = {500000000, 125000000, 500000000};
        return std::pair<cl_ulong, cl_ulong>{0, event % 10 == 1 ? batch[event / 10] : 0};
    };
    EXPECT_EQ(impl.GetCLBandwidth(), 335544320.0 / 0.125);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 30);
}

TEST_F(CLMeasurementsTest, EveryCopyOfABatchCounts)
{
    cl.counters = [](int) { return std::pair<cl_ulong, cl_ulong>{0, 125000000}; };
    EXPECT_EQ(impl.GetCLBandwidth(), 335544320.0 / 1.25);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 10);
}

TEST_F(CLMeasurementsTest, DecreasingCountersWrapAround)
{
    cl.counters = [](int event) { return std::pair<cl_ulong, cl_ulong>{event == 1 ? 1 : 0, 0}; };
    EXPECT_DOUBLE_EQ(impl.GetCLBandwidth(), 335544320.0 / 18446744073.709551615);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 10);
}

TEST_F(CLMeasurementsTest, BandwidthReleasesEverythingButTheEventsOfEarlierBatches)
{
    cl.counters = BatchesOf(200000000);
    impl.GetCLBandwidth();
    EXPECT_THAT(cl.created, UnorderedElementsAre(Pair("context", 1), Pair("queue", 1),
                                                 Pair("buffer", 2), Pair("event", 50)));
    EXPECT_THAT(cl.released, UnorderedElementsAre(Pair("context", 1), Pair("queue", 1),
                                                  Pair("buffer", 2), Pair("event", 10)));
    EXPECT_EQ(CountCalls("clReleaseEvent"), 10);
    EXPECT_THAT(cl.calls, testing::Contains("clReleaseEvent(event 41)"));
    EXPECT_THAT(cl.calls, testing::Contains("clReleaseEvent(event 50)"));
}

TEST_F(CLMeasurementsTest, ExceptionsOfReleasesAreIgnored)
{
    cl.throwing = {"clReleaseCommandQueue", "clReleaseContext", "clReleaseEvent",
                   "clReleaseMemObject"};
    cl.counters = [](int) { return std::pair<cl_ulong, cl_ulong>{0, 250000000}; };
    EXPECT_EQ(impl.GetCLBandwidth(), 335544320.0 / 2.5);
    EXPECT_EQ(impl.GetCLCompute(), 32.0);
    EXPECT_EQ(CountCalls("clReleaseEvent"), 10);
    EXPECT_EQ(CountCalls("clReleaseMemObject"), 3);
    EXPECT_EQ(CountCalls("clReleaseContext"), 2);
}

TEST_F(CLMeasurementsTest, ASecondBandwidthMeasurementMeasuresAgain)
{
    cl.counters = BatchesOf(1000000000);
    impl.GetCLBandwidth();
    impl.GetCLBandwidth();
    EXPECT_EQ(cl.calls.size(), 2 * kBandwidthCalls.size());
}

// Removes the durations at the end of scopes.
Lines WithoutDurations(Lines lines)
{
    for (std::string& line : lines) {
        const std::size_t at = line.find(", duration=");
        if (at != std::string::npos)
            line.resize(at);
    }
    return lines;
}

// Adds the log lines to the recorded calls, to check the order of both.
class InterleavedLog : public CapturedLog {
public:
    explicit InterleavedLog(FakeOpenCL& cl) : CapturedLog(pmutil::gGPUAssay), fCL(cl) {}
    void Write(const char* data, std::size_t size) override
    {
        CapturedLog::Write(data, size);
        if (Text().back() == '\n')
            fCL.calls.push_back(WithoutDurations(Lines()).back());
    }

private:
    FakeOpenCL& fCL;
};

Lines Joined(std::initializer_list<Lines> parts)
{
    Lines whole;
    for (const Lines& part : parts)
        whole.insert(whole.end(), part.begin(), part.end());
    return whole;
}

// The calls of `whole` from index `first` up to `last`.
Lines Calls(const Lines& whole, std::ptrdiff_t first, std::ptrdiff_t last)
{
    return {whole.begin() + first, whole.begin() + last + 1};
}

TEST_F(CLMeasurementsTest, OrderOfCallsAndLogLinesOfBandwidth)
{
    const std::string whole = "GPUImplHardware::DoGetCLBandwidth";
    const std::string check = "GPUImplHardware::checkBandwidthCL";
    const Lines& calls = kBandwidthCalls;
    cl.counters = BatchesOf(1000000000);
    const InterleavedLog log(cl);
    impl.GetCLBandwidth();
    EXPECT_THAT(
        cl.calls,
        ElementsAreArray(Joined({
            {"BEGIN " + whole},
            Calls(calls, 0, 0),
            {whole + ": QGF::OCL::Context context(properties, *iDev);"},
            Calls(calls, 1, 1),
            {whole + ": QGF::OCL::CommandQueue cq(context, *iDev, false, true);"},
            Calls(calls, 2, 2),
            {"BEGIN " + check, check + ": clCreateBuffer d_idata nbytes=16777216"},
            Calls(calls, 3, 3),
            {check + ": clCreateBuffer d_odata nbytes=16777216"},
            Calls(calls, 4, 4),
            {check + ": clFinish"},
            Calls(calls, 5, 5),
            {check + ": copy 100 iterations", check + ": 0 of 100, totalSeconds=0"},
            Calls(calls, 6, 36),
            {"GPUImplHardware::timeBandwidthCL: totalSeconds=1", check + ": seconds=1",
             check + ": totalSeconds=1, BW=3.35544e+08, maxBW=3.35544e+08", check + ": clFinish"},
            Calls(calls, 37, 47),
            {check + ": releasing"},
            Calls(calls, 48, 49),
            {check + ": result=3.35544e+08", "END " + check, "bytesPerSecond=3.35544e+08",
             whole + ": result=3.35544e+08"},
            Calls(calls, 50, 51),
            {"END " + whole},
        })));
}

TEST_F(CLMeasurementsTest, OrderOfCallsAndLogLinesOfCompute)
{
    const std::string whole = "GPUImplHardware::DoGetCLCompute";
    const std::string measure = "GPUImplHardware::MeasureCLCompute";
    const Lines& calls = kComputeCalls;
    cl.counters = [](int) { return std::pair<cl_ulong, cl_ulong>{1000, 250001000}; };
    const InterleavedLog log(cl);
    impl.GetCLCompute();
    EXPECT_THAT(cl.calls, ElementsAreArray(Joined({
                              {"BEGIN " + whole},
                              Calls(calls, 0, 0),
                              {whole + ": QGF::OCL::Context context(properties, *iDev);"},
                              Calls(calls, 1, 1),
                              {whole + ": QGF::OCL::CommandQueue cq(context, *iDev, false, true);"},
                              Calls(calls, 2, 2),
                              {"BEGIN " + measure},
                              Calls(calls, 3, 12),
                              {measure + ": clFinish"},
                              Calls(calls, 13, 14),
                              {measure + ": result=0.25", "END " + measure,
                               "timeForKernelExecution=32", whole + ": result=32"},
                              Calls(calls, 15, 16),
                              {"END " + whole},
                          })));
}

TEST_F(CLMeasurementsTest, EachOfTenBatchesLogsItsFirstCopy)
{
    const CapturedLog log(pmutil::gGPUAssay);
    cl.counters = BatchesOf(50000000);
    impl.GetCLBandwidth();
    Lines counted;
    for (const std::string& line : log.Lines())
        if (line.find(" of 100, ") != std::string::npos)
            counted.push_back(line.substr(line.find(": ") + 2));
    EXPECT_THAT(counted, testing::ElementsAre(
                             "0 of 100, totalSeconds=0", "10 of 100, totalSeconds=0.05",
                             "20 of 100, totalSeconds=0.1", "30 of 100, totalSeconds=0.15",
                             "40 of 100, totalSeconds=0.2", "50 of 100, totalSeconds=0.25",
                             "60 of 100, totalSeconds=0.3", "70 of 100, totalSeconds=0.35",
                             "80 of 100, totalSeconds=0.4", "90 of 100, totalSeconds=0.45"));
}

TEST_F(CLMeasurementsTest, TheLastOfTenBatchesMayBeTheFastest)
{
    cl.counters = [](int event) {
        return std::pair<cl_ulong, cl_ulong>{0, event == 91       ? 62500000
                                                : event % 10 == 1 ? 100000000
                                                                  : 0};
    };
    EXPECT_EQ(impl.GetCLBandwidth(), 335544320.0 / 0.0625);
    EXPECT_EQ(CountCalls("clEnqueueCopyBuffer"), 100);
}

TEST_F(CLMeasurementsTest, ComputeFreesItsData)
{
    const std::size_t before = assay_test::LargeBlocks();
    impl.GetCLCompute();
    cl.content = std::vector<float>();
    EXPECT_EQ(assay_test::LargeBlocks(), before);
    for (const char* const call : {"clCreateProgramWithSource", "clWaitForEvents"}) {
        cl.throwing = {call};
        EXPECT_THROW(impl.GetCLCompute(), std::runtime_error);
        cl.content = std::vector<float>();
        EXPECT_EQ(assay_test::LargeBlocks(), before) << call;
    }
}

TEST_F(CLMeasurementsTest, BandwidthLogsEachStepBeforeItsCall)
{
    const CapturedLog log(pmutil::gGPUAssay);
    cl.counters = BatchesOf(500000000);
    impl.GetCLBandwidth();
    EXPECT_THAT(
        WithoutDurations(log.Lines()),
        testing::ElementsAre(
            "BEGIN GPUImplHardware::DoGetCLBandwidth",
            "GPUImplHardware::DoGetCLBandwidth: QGF::OCL::Context context(properties, *iDev);",
            "GPUImplHardware::DoGetCLBandwidth: QGF::OCL::CommandQueue cq(context, *iDev, false, "
            "true);",
            "BEGIN GPUImplHardware::checkBandwidthCL",
            "GPUImplHardware::checkBandwidthCL: clCreateBuffer d_idata nbytes=16777216",
            "GPUImplHardware::checkBandwidthCL: clCreateBuffer d_odata nbytes=16777216",
            "GPUImplHardware::checkBandwidthCL: clFinish",
            "GPUImplHardware::checkBandwidthCL: copy 100 iterations",
            "GPUImplHardware::checkBandwidthCL: 0 of 100, totalSeconds=0",
            "GPUImplHardware::timeBandwidthCL: totalSeconds=0.5",
            "GPUImplHardware::checkBandwidthCL: seconds=0.5",
            "GPUImplHardware::checkBandwidthCL: totalSeconds=0.5, BW=6.71089e+08, "
            "maxBW=6.71089e+08",
            "GPUImplHardware::checkBandwidthCL: 10 of 100, totalSeconds=0.5",
            "GPUImplHardware::timeBandwidthCL: totalSeconds=0.5",
            "GPUImplHardware::checkBandwidthCL: seconds=0.5",
            "GPUImplHardware::checkBandwidthCL: totalSeconds=1, BW=6.71089e+08, "
            "maxBW=6.71089e+08",
            "GPUImplHardware::checkBandwidthCL: clFinish",
            "GPUImplHardware::checkBandwidthCL: releasing",
            "GPUImplHardware::checkBandwidthCL: result=6.71089e+08",
            "END GPUImplHardware::checkBandwidthCL", "bytesPerSecond=6.71089e+08",
            "GPUImplHardware::DoGetCLBandwidth: result=6.71089e+08",
            "END GPUImplHardware::DoGetCLBandwidth"));
}

TEST_F(CLMeasurementsTest, NegativeVerbosityLogsWithoutScopes)
{
    const CapturedLog log(pmutil::gGPUAssay);
    pmutil::GetDebugValue(pmutil::gGPUAssay) = -1;
    cl.counters = BatchesOf(1000000000);
    impl.GetCLBandwidth();
    impl.GetCLCompute();
    EXPECT_THAT(log.Lines(), testing::Contains("bytesPerSecond=3.35544e+08"));
    EXPECT_THAT(log.Lines(), testing::Contains("timeForKernelExecution=8"));
    for (const std::string& line : log.Lines()) {
        EXPECT_NE(line.compare(0, 6, "BEGIN "), 0) << line;
        EXPECT_NE(line.compare(0, 4, "END "), 0) << line;
    }
}

// Rows: the index of the failed call and the last line that is logged before it.
TEST_F(CLMeasurementsTest, TheLastLogLineNamesTheFailedBandwidthCall)
{
    const std::pair<std::size_t, const char*> rows[] = {
        {1, "GPUImplHardware::DoGetCLBandwidth: QGF::OCL::Context context(properties, *iDev);"},
        {2, "GPUImplHardware::DoGetCLBandwidth: QGF::OCL::CommandQueue cq(context, *iDev, false, "
            "true);"},
        {3, "GPUImplHardware::checkBandwidthCL: clCreateBuffer d_idata nbytes=16777216"},
        {4, "GPUImplHardware::checkBandwidthCL: clCreateBuffer d_odata nbytes=16777216"},
        {6, "GPUImplHardware::checkBandwidthCL: 0 of 100, totalSeconds=0"},
    };
    for (const auto& [index, expected] : rows) {
        const CapturedLog log(pmutil::gGPUAssay);
        cl.calls.clear();
        cl.failing = {{index, CL_OUT_OF_RESOURCES}};
        EXPECT_ANY_THROW(impl.GetCLBandwidth());
        std::string last;
        for (const std::string& line : log.Lines())
            if (line.compare(0, 4, "END ") != 0)
                last = line;
        EXPECT_EQ(last, expected);
    }
}

TEST_F(CLMeasurementsTest, ComputeMakesExactlyTheseCalls)
{
    cl.counters = [](int) { return std::pair<cl_ulong, cl_ulong>{1000, 250001000}; };
    EXPECT_EQ(impl.GetCLCompute(), 32.0);
    EXPECT_THAT(cl.calls, ElementsAreArray(kComputeCalls));
}

TEST_F(CLMeasurementsTest, ComputeMakesTheSameCallsWithLoggingOn)
{
    const CapturedLog log(pmutil::gGPUAssay);
    impl.GetCLCompute();
    EXPECT_THAT(cl.calls, ElementsAreArray(kComputeCalls));
}

TEST_F(CLMeasurementsTest, ComputeStopsOrContinuesAfterEachFailedCall)
{
    const std::pair<bool, cl_int> cases[] = {
        {false, CL_INVALID_WORK_GROUP_SIZE}, {true, CL_INVALID_WORK_GROUP_SIZE}, {false, 1}};
    for (const auto& [logging, status] : cases) {
        std::unique_ptr<CapturedLog> log;
        if (logging)
            log = std::make_unique<CapturedLog>(pmutil::gGPUAssay);
        for (std::size_t index = 0; index < kComputeCalls.size(); ++index) {
            SCOPED_TRACE(kComputeCalls[index]);
            const assay_test::CapturedFailures reported;
            cl.calls.clear();
            cl.created.clear();
            cl.failing = {{index, status}};
            const After after = AfterComputeFailure(index);
            if (index <= 2) {
                EXPECT_THROW(impl.GetCLCompute(), QGF::LogicalException);
            } else if (after == After::Continues) {
                EXPECT_NO_THROW(impl.GetCLCompute());
            } else {
                EXPECT_THROW(impl.GetCLCompute(), std::runtime_error);
                EXPECT_THAT(reported.texts(), testing::ElementsAre(kRequirement));
            }
            EXPECT_THAT(cl.calls, ElementsAreArray(CallsUpTo(kComputeCalls, index, after)));
        }
    }
}

TEST_F(CLMeasurementsTest, ComputeWithoutDurationScoresZero)
{
    cl.counters = [](int) { return std::pair<cl_ulong, cl_ulong>{77, 77}; };
    EXPECT_EQ(impl.GetCLCompute(), 0.0);
    EXPECT_THAT(failures.texts(), IsEmpty());
}

TEST_F(CLMeasurementsTest, ComputeNeverReleasesProgramKernelAndEvent)
{
    impl.GetCLCompute();
    EXPECT_THAT(cl.created,
                UnorderedElementsAre(Pair("context", 1), Pair("queue", 1), Pair("program", 1),
                                     Pair("kernel", 1), Pair("buffer", 1), Pair("event", 1)));
    EXPECT_THAT(cl.released,
                UnorderedElementsAre(Pair("context", 1), Pair("queue", 1), Pair("buffer", 1)));
}

TEST_F(CLMeasurementsTest, TheKernelTextIsOneLineWithSevenTabsAndTwoBlanksBetweenStatements)
{
    impl.GetCLCompute();
    const char* const statements[] = {
        "__kernel void justIterate( __global float* v, unsigned int len ){",
        "int gid = get_global_id(0);",
        "if(gid>=len) return;",
        "float data = v[gid];",
        "float variant = (float)(gid % 3);",
        "for ( int i = 0 ; i < 4096; i++){",
        "data = data  *  1.2f * variant ;",
        "}",
        "v [ gid ] = data ;",
        "}",
    };
    std::string expected;
    for (const char* statement : statements) {
        if (!expected.empty())
            expected += std::string(7, '\t') + std::string(2, ' ');
        expected += statement;
    }
    EXPECT_EQ(cl.source, expected);
    EXPECT_EQ(cl.source.size(), 331U);
}

TEST_F(CLMeasurementsTest, TheKernelProcessesTheNextRandomNumbers)
{
    std::srand(1); // the state that a process starts with
    impl.GetCLCompute();
    const std::vector<float> first = cl.content;
    impl.GetCLCompute();
    const std::vector<float> second = cl.content;
    std::srand(1);
    ASSERT_EQ(first.size(), 1048576U);
    ASSERT_EQ(second.size(), 1048576U);
    for (const std::vector<float>* data : {&first, &second})
        for (std::size_t i = 0; i < data->size(); ++i)
            // NOLINTNEXTLINE(concurrency-mt-unsafe): the generator under test has no other user
            ASSERT_EQ((*data)[i], static_cast<float>(std::rand())) << i;
}

TEST_F(CLMeasurementsTest, TheKernelsArgumentsAreTheBufferAndItsLength)
{
    impl.GetCLCompute();
    EXPECT_EQ(cl.kernelArguments[0], CLValue(std::uintptr_t{1}).bytes);
    EXPECT_EQ(cl.kernelArguments[1], CLValue(cl_uint{1048576}).bytes);
}

TEST_F(CLMeasurementsTest, ComputeLogsEachStep)
{
    const CapturedLog log(pmutil::gGPUAssay);
    cl.counters = [](int) { return std::pair<cl_ulong, cl_ulong>{0, 250000000}; };
    impl.GetCLCompute();
    EXPECT_THAT(
        WithoutDurations(log.Lines()),
        testing::ElementsAre(
            "BEGIN GPUImplHardware::DoGetCLCompute",
            "GPUImplHardware::DoGetCLCompute: QGF::OCL::Context context(properties, *iDev);",
            "GPUImplHardware::DoGetCLCompute: QGF::OCL::CommandQueue cq(context, *iDev, false, "
            "true);",
            "BEGIN GPUImplHardware::MeasureCLCompute",
            "GPUImplHardware::MeasureCLCompute: clFinish",
            "GPUImplHardware::MeasureCLCompute: result=0.25",
            "END GPUImplHardware::MeasureCLCompute", "timeForKernelExecution=32",
            "GPUImplHardware::DoGetCLCompute: result=32", "END GPUImplHardware::DoGetCLCompute"));
}

} // namespace
