// Tests for GPUAssayTester::RunTest, which runs an object for every device of a list. The objects
// are temporaries of RunTest's caller. They don't own their names.
#pragma once

#include <cstdint>

#include "GPUAssayTester.h"

namespace assay {

class GPUTest {
public:
    GPUTest() = default;
    virtual ~GPUTest() = default;
    GPUTest(const GPUTest&) = delete;
    GPUTest& operator=(const GPUTest&) = delete;

    // Runs the test for one device. Throws std::bad_cast if the device or the tester has another
    // type than the test needs; a null device fails the shared pointer's assertion.
    virtual void Run(GPUAssayTester& tester, const GPUEntry& entry) const = 0;
};

// Queries an OpenGL string.
class GLStringTest : public GPUTest {
public:
    GLStringTest(const char* testName, std::int32_t testCode) : name(testName), code(testCode) {}
    void Run(GPUAssayTester& tester, const GPUEntry& entry) const override;

    const char* const name;
    const std::int32_t code;
};

// Queries `count` OpenGL integers.
class IntegervTest : public GPUTest {
public:
    IntegervTest(const char* testName, std::int32_t testCode, std::uint64_t testCount)
        : name(testName), code(testCode), count(testCount)
    {}
    void Run(GPUAssayTester& tester, const GPUEntry& entry) const override;

    const char* const name;
    const std::int32_t code;
    const std::uint64_t count;
};

// Queries `count` limits of fragment programs.
class ProgramvTest : public GPUTest {
public:
    ProgramvTest(const char* testName, std::int32_t testCode, std::uint64_t testCount)
        : name(testName), code(testCode), count(testCount)
    {}
    void Run(GPUAssayTester& tester, const GPUEntry& entry) const override;

    const char* const name;
    const std::int32_t code;
    const std::uint64_t count;
};

// Queries whether an OpenGL extension is supported.
class ExtensionTest : public GPUTest {
public:
    ExtensionTest(const char* testName, std::int32_t testID) : name(testName), id(testID) {}
    void Run(GPUAssayTester& tester, const GPUEntry& entry) const override;

    const char* const name;
    const std::int32_t id;
};

// Calls an operation of the tester for a device of type Device.
template <typename Tester, typename Device>
class TestFunc : public GPUTest {
public:
    using Operation = void (Tester::*)(std::string tag, Device& gpu);

    explicit TestFunc(Operation operation) : fOperation(operation) {}
    void Run(GPUAssayTester& tester, const GPUEntry& entry) const override
    {
        (dynamic_cast<Tester&>(tester).*fOperation)(entry.tag, dynamic_cast<Device&>(*entry.gpu));
    }

private:
    const Operation fOperation;
};

} // namespace assay
