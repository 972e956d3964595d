#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "qgf/DriverCall.h"
#include "qgf/OCLFunctionTable.h"
#include "qgf/OGLEntryPoint.h"
#include "support/RecordedCalls.h"

namespace {

using assay_test::RecordedCalls;
using QGF::Core::DriverCall;
using QGF::Core::Interface;
using testing::ElementsAre;
using testing::IsEmpty;

TEST(DriverCall, TellsItsBeginAndItsEnd)
{
    RecordedCalls calls;
    {
        const DriverCall call(Interface::kOpenCL);
        calls.Add("within");
    }
    EXPECT_THAT(calls.Get(), ElementsAre("before OpenCL", "within", "after OpenCL"));
}

TEST(DriverCall, TellsItsEndWhenItThrows)
{
    RecordedCalls calls;
    try {
        const DriverCall call(Interface::kOpenGL);
        throw 1;
    } catch (int) {
        calls.Add("caught");
    }
    EXPECT_THAT(calls.Get(), ElementsAre("before OpenGL", "after OpenGL", "caught"));
}

TEST(DriverCall, TellsNobodyWithoutAnObserver)
{
    EXPECT_FALSE(QGF::Core::IsObserved());
    const DriverCall call(Interface::kOpenGL);
}

std::uint32_t Double(std::uint32_t value)
{
    return 2 * value;
}

TEST(DriverCall, IsEachCallOfAnOpenGLEntryPoint)
{
    const QGF::OGL::EntryPointLookup lookup = {
        [](void*, const char*) { return reinterpret_cast<QGF::Core::Proc>(Double); }, nullptr};
    const QGF::OGL::EntryPoint<std::uint32_t(std::uint32_t)> entryPoint(lookup, "glDouble");
    RecordedCalls calls;
    EXPECT_EQ(entryPoint("f.cpp", 12, 21), 42U);
    EXPECT_THAT(calls.Get(), ElementsAre("before OpenGL", "after OpenGL"));
}

RecordedCalls* gCalls = nullptr;

cl_int Finish(cl_command_queue queue)
{
    if (gCalls != nullptr)
        gCalls->Add(queue == nullptr ? "finish" : "finish another");
    return CL_OUT_OF_RESOURCES;
}

TEST(DriverCall, IsEachCallOfAnObservedOpenCLTable)
{
    QGF::OCL::FunctionTable table{};
    table.clFinish = Finish;
    QGF::OCL::ObserveCalls(table);
    EXPECT_EQ(table.clBuildProgram, nullptr); // the library lacks it
    RecordedCalls calls;
    gCalls = &calls;
    EXPECT_EQ(table.clFinish(nullptr), CL_OUT_OF_RESOURCES);
    gCalls = nullptr;
    EXPECT_THAT(calls.Get(), ElementsAre("before OpenCL", "finish", "after OpenCL"));
}

cl_int Release(cl_context)
{
    return CL_SUCCESS;
}

TEST(DriverCall, IsNoCallOfAnotherTable)
{
    QGF::OCL::FunctionTable table{};
    table.clReleaseContext = Release;
    RecordedCalls calls;
    EXPECT_EQ(table.clReleaseContext(nullptr), CL_SUCCESS);
    EXPECT_THAT(calls.Get(), IsEmpty());
}

} // namespace
