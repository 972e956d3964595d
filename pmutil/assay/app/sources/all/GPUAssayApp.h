// The application: parses the command line, runs the tester and converts failures to messages and
// an exit status. A subclass may add options and make another tester. Main thread only.
#pragma once

#include <cstdint>
#include <list>
#include <stdexcept>
#include <string>

#include <boost/shared_ptr.hpp>

#include "GPUAssayAppAndHost.h"

namespace pmutil {
class PMLogger;
}

namespace assay {

class GPUAssayTester;

class GPUAssayApp : public GPUAssayAppAndHost {
public:
    using Arguments = std::list<std::string>;

    // Thrown for an invalid command line and for -help.
    class UsageException : public std::runtime_error {
    public:
        UsageException() : std::runtime_error("usage") {}
    };

    // Exit statuses of a failed run and of a usage error.
    static constexpr std::int32_t kStatusFailed = 2;
    static constexpr std::int32_t kStatusUsage = 3;

    GPUAssayApp();
    ~GPUAssayApp() override;

    // Runs the program. `arguments` are the program's name and its options; they are consumed.
    // Writes the report to standard output and failures to standard error. Returns the exit status:
    // 0 or the value of -exit on success, 2 if a test failed or an exception ended the run, 3 for a
    // usage error.
    std::int32_t Run(Arguments& arguments);

    // Writes a line of the report. If that fails, the line is lost and "DoStdout failed" is written
    // to standard error.
    void Stdout(const std::string& text);

    // Writes a line to standard error. Never throws.
    void Stderr(const std::string& text);

    // Writes a comment line of the report: "# " and the text.
    void Comment(const std::string& text);

    // The run's logger and tester, made by the first call.
    const boost::shared_ptr<pmutil::PMLogger>& GetLogger();
    const boost::shared_ptr<GPUAssayTester>& GetTester();

    // The number of steps after which the tester fails as programmed; -1 for never. If the tester
    // exists, get and set its values.
    std::int32_t GetCrashAfter() const;
    void SetCrashAfter(std::int32_t steps);
    std::int32_t GetThrowAfter() const;
    void SetThrowAfter(std::int32_t steps);

    std::int32_t GetVerbose() const { return fVerbose; }
    void SetVerbose(std::int32_t verbose) { fVerbose = verbose; }
    // Seconds. Stored only.
    std::int32_t GetTimeout() const { return fTimeout; }
    void SetTimeout(std::int32_t seconds) { fTimeout = seconds; }
    // Milliseconds. Stored only.
    std::int32_t GetHang() const { return fHang; }
    void SetHang(std::int32_t milliseconds) { fHang = milliseconds; }
    const std::string& GetAppName() const { return fAppName; }
    void SetAppName(const std::string& name) { fAppName = name; }
    const std::string& GetUsageName() const { return fUsageName; }

    // Parses the number of an option by pmutil::ParseInteger.
    static std::int32_t ParseInteger(const std::string& text);

    // Starts and ends what a run needs. Term isn't called after a failure.
    virtual void Init();
    virtual void Term();

    // Appends the lines of the usage text.
    virtual void Usage(Arguments& lines);

    // Performs the known options, from left to right, and removes them from the list. Throws
    // UsageException for "-help".
    virtual void ParseArguments(Arguments& arguments);

    // Performs an option. Returns false for an unknown name. A subclass with more options overrides
    // this and calls it for the others.
    virtual bool ParseOption(const std::string& name, const std::string& value);

    // Splits "-name=value" and performs the option. Returns false if the argument isn't an option.
    // An override may remove following arguments from `rest`.
    virtual bool ParseArgument(const std::string& argument, Arguments& rest);

    // Make a new logger and a new tester; the caller owns them. If CreateTester returns null, a
    // GPUAssayTester is used.
    virtual pmutil::PMLogger* CreateLogger();
    virtual GPUAssayTester* CreateTester();

    // Implement Comment, Stdout and Stderr. They may throw.
    virtual void DoComment(const std::string& text);
    virtual void DoStdout(const std::string& text);
    virtual void DoStderr(const std::string& text);

private:
    std::int32_t fExitStatus = 0;
    std::int32_t fCrashAfter = -1;
    std::int32_t fThrowAfter = -1;
    std::int32_t fVerbose = 0;
    std::int32_t fTimeout = 5;
    std::int32_t fHang = 0;
    std::string fUsageName;
    std::string fAppName;
    boost::shared_ptr<pmutil::PMLogger> fLogger;
    // The last member, so that it is destroyed first: the tester has a pointer to this object.
    boost::shared_ptr<GPUAssayTester> fTester;
};

} // namespace assay
