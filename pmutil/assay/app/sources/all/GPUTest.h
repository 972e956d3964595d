// Units of work for GPUAssayTester::RunTest: an object says what to do for one device, and RunTest
// applies it to every device of a list. Test objects are temporaries of RunTest's caller; they own
// nothing, and the names in them must outlive them.
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

    // Performs the test for one device. Throws std::bad_cast if the device or the tester isn't of
    // the kind that the test is for; a null device trips the shared pointer's own assertion.
    virtual void Run(GPUAssayTester& tester, const GPUEntry& entry) const = 0;
};

// Asks for an OpenGL string.
class GLStringTest : public GPUTest {
public:
    GLStringTest(const char* testName, std::int32_t testCode) : name(testName), code(testCode) {}
    void Run(GPUAssayTester& tester, const GPUEntry& entry) const override;

    const char* const name;
    const std::int32_t code;
};

// Asks for `count` OpenGL integers.
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

// Asks for `count` limits of fragment programs.
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

// Asks whether an OpenGL extension is there.
class ExtensionTest : public GPUTest {
public:
    ExtensionTest(const char* testName, std::int32_t testID) : name(testName), id(testID) {}
    void Run(GPUAssayTester& tester, const GPUEntry& entry) const override;

    const char* const name;
    const std::int32_t id;
};

// Calls an operation of the tester, for devices of type Device.
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
