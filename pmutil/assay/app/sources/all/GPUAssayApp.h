// The application: takes the command line, runs the tester and turns whatever happens into messages
// and an exit status. A subclass may add options and bring its own tester. Main thread only.
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

    // The command line can't be taken, or asks for the usage text.
    class UsageException : public std::runtime_error {
    public:
        UsageException() : std::runtime_error("usage") {}
    };

    // What a run returns where no option has its say.
    static constexpr std::int32_t kStatusFailed = 2;
    static constexpr std::int32_t kStatusUsage = 3;

    GPUAssayApp();
    ~GPUAssayApp() override;

    // One whole run. `arguments` holds the program's name and its options, and is consumed. Returns
    // the exit status: 0, or what -exit asked for; 2 if a test failed or an exception ended the
    // run; 3 for a bad command line. Reports on standard output, tells failures on standard error.
    std::int32_t Run(Arguments& arguments);

    // Writes a line of the report. Where that fails the line is lost, and "DoStdout failed" goes to
    // standard error.
    void Stdout(const std::string& text);

    // Writes a line to standard error. Never throws.
    void Stderr(const std::string& text);

    // Writes a comment line of the report: "# " and the text.
    void Comment(const std::string& text);

    // The run's logger and tester, made at the first call.
    const boost::shared_ptr<pmutil::PMLogger>& GetLogger();
    const boost::shared_ptr<GPUAssayTester>& GetTester();

    // The steps after which the tester fails as programmed; -1 for never. These are the tester's
    // own once it exists.
    std::int32_t GetCrashAfter() const;
    void SetCrashAfter(std::int32_t steps);
    std::int32_t GetThrowAfter() const;
    void SetThrowAfter(std::int32_t steps);

    std::int32_t GetVerbose() const { return fVerbose; }
    void SetVerbose(std::int32_t verbose) { fVerbose = verbose; }
    // Seconds; nothing acts on them.
    std::int32_t GetTimeout() const { return fTimeout; }
    void SetTimeout(std::int32_t seconds) { fTimeout = seconds; }
    // Milliseconds; nothing acts on them.
    std::int32_t GetHang() const { return fHang; }
    void SetHang(std::int32_t milliseconds) { fHang = milliseconds; }
    const std::string& GetAppName() const { return fAppName; }
    void SetAppName(const std::string& name) { fAppName = name; }
    const std::string& GetUsageName() const { return fUsageName; }

    // pmutil::ParseInteger, with which all numbers among the options are read.
    static std::int32_t ParseInteger(const std::string& text);

    // Starts and ends what a run needs. Term isn't called after a failure.
    virtual void Init();
    virtual void Term();

    // Appends the lines of the usage text.
    virtual void Usage(Arguments& lines);

    // Takes what it knows off the list, from left to right, and leaves the rest. Throws
    // UsageException at "-help".
    virtual void ParseArguments(Arguments& arguments);

    // Performs one named option; false for an unknown name. A subclass with options of its own
    // overrides this and falls back on it.
    virtual bool ParseOption(const std::string& name, const std::string& value);

    // Splits "-name=value" and performs it; false if the argument is no option. An override may
    // take a following argument off `rest`.
    virtual bool ParseArgument(const std::string& argument, Arguments& rest);

    // Make a new logger and a new tester, owned by the caller. No tester (null) stands for the
    // plain GPUAssayTester.
    virtual pmutil::PMLogger* CreateLogger();
    virtual GPUAssayTester* CreateTester();

    // What Comment, Stdout and Stderr perform. Each may throw.
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
    // Last, so that it goes first: the tester points back at this object.
    boost::shared_ptr<GPUAssayTester> fTester;
};

} // namespace assay
