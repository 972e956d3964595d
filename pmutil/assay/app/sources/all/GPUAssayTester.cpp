#include "GPUAssayTester.h"

#include <exception>
#include <iostream>
#include <stdexcept>

#include "GPUAssayApp.h"
#include "GPUTest.h"
#include "Output.h"
#include "ReportLine.h"
#include "Timestamp.h"
#include "pmutil/PMLogging.h"
#include "pmutil_gpu/DriverFileLog.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "qgf/Core.h"

namespace assay {

GPUAssayTester::GPUAssayTester(GPUAssayApp* app) : fApp(app) {}
GPUAssayTester::~GPUAssayTester() = default;

void GPUAssayTester::Run()
{
    fStep = 0;
    pmutil::LogDriverFiles();
    DoRunStart();
    DoRunTimestamp("assayStart");
    DoRunQGFCoreInitialize();
    DoRunQGFOGLInitialize();
    DoRunOGLContextCreate();
    DoRunGLEnumerate();
    DoRunGLTests();
    DoRunQGFOCLInitialize();
    if (fOCLAvailable) {
        DoRunCLEnumerate();
        DoRunCLTests();
    }
    DoRunTimestamp("assayEnd");
    Step();
}

void GPUAssayTester::DoRunStart()
{
    GPUAssayTester::Step();
}

void GPUAssayTester::Step()
{
    const std::uint32_t step = fStep++;
    if (step >= fCrashAfter) {
        Crash();
        GPUAssayTester::Crash();
    }
    if (step == static_cast<std::uint32_t>(fThrowAfter))
        throw std::runtime_error("Programmed throw");
}

void GPUAssayTester::Crash()
{
    throw std::runtime_error("programmed failure");
}

std::string GPUAssayTester::GetTimestamp()
{
    return LocalTimeText(std::time(nullptr));
}

void GPUAssayTester::DoRunTimestamp(const std::string& key)
{
    Report(TextLine(key, GetTimestamp()));
}

void GPUAssayTester::RunTest(GPUEntries& entries, const GPUTest& test)
{
    for (auto next = entries.begin(); next != entries.end();) {
        const auto entry = next++;
        bool failed = true;
        try {
            test.Run(*this, *entry);
            failed = false;
        } catch (const QGF::LogicalException& exception) {
            WriteLine(std::cerr, stderr,
                      std::string("QGF::LogicalException: ") + TextOrNull(exception.message()));
        } catch (const std::exception& exception) {
            WriteLine(std::cerr, stderr, std::string("exception: ") + TextOrNull(exception.what()));
        } catch (...) {
            WriteLine(std::cerr, stderr, "unknown exception");
        }
        if (failed) {
            PM_LOG(pmutil::gGPUAssay, "Testing terminated for " << entry->tag);
            ++fFailures;
            entries.erase(entry);
        }
    }
}

void GPUAssayTester::Print(const std::string& line)
{
    fApp->Stdout(line);
}

void GPUAssayTester::Report(const std::string& line)
{
    Print(line);
    GPUAssayTester::Step();
}

} // namespace assay
