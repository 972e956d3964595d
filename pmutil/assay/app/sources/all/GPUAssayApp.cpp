#include "GPUAssayApp.h"

#include <exception>
#include <iostream>

#include "GPUAssayTester.h"
#include "Output.h"
#include "pmutil/LogSinks.h"
#include "pmutil/PMLogging.h"
#include "pmutil_gpu/GPUImplHardware.h"
#include "qgf/Core.h"

namespace assay {

GPUAssayApp::GPUAssayApp() = default;
GPUAssayApp::~GPUAssayApp() = default;

std::int32_t GPUAssayApp::Run(Arguments& arguments)
{
    try {
        fExitStatus = 0;
        Init();
        GetLogger();
        if (!arguments.empty()) {
            fAppName = std::move(arguments.front());
            arguments.pop_front();
        }
        ParseArguments(arguments);
        if (!arguments.empty())
            throw UsageException();
        pmutil::GetDebugValue(pmutil::gGPUAssay) = fVerbose;
        GetTester();
        fTester->fCrashAfter = static_cast<std::uint32_t>(fCrashAfter);
        fTester->fThrowAfter = fThrowAfter;
        fTester->Run();
        if (fTester->fFailures > 0)
            fExitStatus = kStatusFailed;
        Term();
    } catch (const QGF::LogicalException& exception) {
        fExitStatus = kStatusFailed;
        Stderr(std::string("QGF::LogicalException: ") + TextOrNull(exception.message()));
    } catch (const UsageException& exception) {
        fExitStatus = kStatusUsage;
        Stderr(std::string("Usage exception: ") + TextOrNull(exception.what()));
        Arguments lines;
        Usage(lines);
        for (const std::string& line : lines)
            Stderr(line);
    } catch (const std::exception& exception) {
        fExitStatus = kStatusFailed;
        Stderr(std::string("exception: ") + TextOrNull(exception.what()));
    } catch (...) {
        fExitStatus = kStatusFailed;
        Stderr("unknown exception");
    }
    return fExitStatus;
}

void GPUAssayApp::Stdout(const std::string& text)
{
    try {
        DoStdout(text);
    } catch (...) {
        Stderr("DoStdout failed");
    }
}

void GPUAssayApp::Stderr(const std::string& text)
{
    try {
        DoStderr(text);
    } catch (...) {
        WriteLine(std::cerr, stderr, text);
    }
}

void GPUAssayApp::Comment(const std::string& text)
{
    DoComment(text);
}

const boost::shared_ptr<pmutil::PMLogger>& GPUAssayApp::GetLogger()
{
    if (!fLogger)
        fLogger.reset(CreateLogger());
    return fLogger;
}

const boost::shared_ptr<GPUAssayTester>& GPUAssayApp::GetTester()
{
    if (!fTester)
        fTester.reset(CreateTester());
    if (!fTester)
        fTester.reset(new GPUAssayTester(this));
    return fTester;
}

std::int32_t GPUAssayApp::GetCrashAfter() const
{
    return fTester ? static_cast<std::int32_t>(fTester->fCrashAfter) : fCrashAfter;
}

void GPUAssayApp::SetCrashAfter(std::int32_t steps)
{
    fCrashAfter = steps;
    if (fTester)
        fTester->fCrashAfter = static_cast<std::uint32_t>(steps);
}

std::int32_t GPUAssayApp::GetThrowAfter() const
{
    return fTester ? fTester->fThrowAfter : fThrowAfter;
}

void GPUAssayApp::SetThrowAfter(std::int32_t steps)
{
    fThrowAfter = steps;
    if (fTester)
        fTester->fThrowAfter = steps;
}

void GPUAssayApp::Init()
{
    pmutil::InitLogging();
}

void GPUAssayApp::Term() {}

pmutil::PMLogger* GPUAssayApp::CreateLogger()
{
    return new pmutil::AssayLogger;
}

GPUAssayTester* GPUAssayApp::CreateTester()
{
    return new GPUAssayTester(this);
}

void GPUAssayApp::DoComment(const std::string& text)
{
    Stdout("# " + text);
}

void GPUAssayApp::DoStdout(const std::string& text)
{
    if (!WriteLine(std::cout, stdout, text))
        throw std::runtime_error("can't write to standard output");
}

void GPUAssayApp::DoStderr(const std::string& text)
{
    if (!WriteLine(std::cerr, stderr, text))
        throw std::runtime_error("can't write to standard error");
}

} // namespace assay
