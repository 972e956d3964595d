// Runs a program for at most some seconds, prints its lines as they come, and says how it ended.
//
// usage: run_assay PROGRAM SECONDS [argument...]
#include <cstdio>
#include <cstdlib>
#include <sstream>

#include <boost/filesystem/path.hpp>
#include <boost/make_shared.hpp>

#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/OutputTask.h"

class App : public pmutil::ConsoleApp {
public:
    // Waits until the child counts as running; not for ever, since it never does if the launch
    // fails.
    void AwaitRunning()
    {
        const long limit = static_cast<long>(GetShortWaitSeconds() * 800); // milliseconds
        boost::unique_lock<boost::mutex> lock(fRunningMutex);
        fRunningCond.timed_wait(lock, boost::posix_time::milliseconds(limit),
                                [this] { return fRunning; });
    }

private:
    void OnRunning() override
    {
        const boost::unique_lock<boost::mutex> lock(fRunningMutex);
        fRunning = true;
        fRunningCond.notify_all();
    }

    boost::mutex fRunningMutex;
    boost::condition_variable fRunningCond;
    bool fRunning = false;
};

class LinePrinter : public pmutil::OutputTask {
public:
    LinePrinter(const boost::shared_ptr<App>& app, std::FILE* stream) : fApp(app), fStream(stream)
    {}

private:
    void DoRun() override
    {
        const boost::shared_ptr<pmutil::Reader> reader = GetReader();
        std::string text; // up to a line's end, which may come with the next block
        char block[4096];
        while (const std::uint64_t count = reader->ReadSome(block, sizeof block)) {
            text.append(block, count);
            const std::size_t whole = text.rfind('\n') + 1;
            std::fwrite(text.data(), 1, whole, fStream);
            std::fflush(fStream);
            text.erase(0, whole);
        }
        std::fwrite(text.data(), 1, text.size(), fStream);
        if (const boost::shared_ptr<App> app = fApp.lock())
            app->AwaitRunning();
    }

    boost::weak_ptr<App> fApp;
    std::FILE* fStream;
};

// The program as the launcher takes it. On Windows it is put on the command line as it stands,
// where a path with blanks needs quotation marks.
static std::wstring GetProgram(const char* path)
{
    constexpr bool isWindows = boost::filesystem::path::preferred_separator == '\\';
    const std::wstring program = boost::filesystem::path(path).wstring();
    return isWindows ? L'"' + program + L'"' : program;
}

int main(int argc, char** argv)
try {
    if (argc < 3)
        return std::fputs("usage: run_assay PROGRAM SECONDS [argument...]\n", stderr), 2;
    const auto app = boost::make_shared<App>();
    pmutil::ConsoleAppLauncher launcher;
    launcher.SetConsoleApp(app);
    launcher.SetLaunchParams(pmutil::LaunchParams(boost::make_shared<LinePrinter>(app, stdout),
                                                  boost::make_shared<LinePrinter>(app, stderr),
                                                  {argv + 3, argv + argc}, GetProgram(argv[1])));
    int exitCode = 0;
    pmutil::State end = launcher.LaunchAndWait(&exitCode, std::atof(argv[2]));
    if (end == pmutil::State::kTimeout) {
        launcher.Kill();
        end = launcher.Wait(&exitCode, pmutil::ConsoleApp::GetDefaultWaitSeconds());
    }
    std::ostringstream verdict; // Idle if another process holds its output
    verdict << "Verdict: " << end << ", exit code " << exitCode << '\n';
    std::fputs(verdict.str().c_str(), stderr);
    return end == pmutil::State::kFinished ? exitCode : 3;
} catch (const std::exception& failure) {
    std::fprintf(stderr, "Verdict: no run, %s\n", failure.what());
    return 4;
}
