// Hosts with unusual states.
#include <csignal>
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <clocale>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Advices.h"

namespace {

// What a library must leave as it is.
struct State {
    std::string fFolder;
    std::string fLocale = std::setlocale(LC_ALL, nullptr);
    std::vector<void (*)(int)> fHandlers;
    sigset_t fMask{};

    State()
    {
        char folder[4096];
        fFolder = ::getcwd(folder, sizeof folder);
        for (int number = 1; number < SIGRTMAX; ++number) {
            struct sigaction action = {};
            ::sigaction(number, nullptr, &action);
            fHandlers.push_back(action.sa_handler);
        }
        ::pthread_sigmask(SIG_SETMASK, nullptr, &fMask);
    }

    bool operator==(const State& other) const
    {
        return fFolder == other.fFolder && fLocale == other.fLocale &&
               fHandlers == other.fHandlers && std::memcmp(&fMask, &other.fMask, sizeof fMask) == 0;
    }
};

TEST(LibraryHost, KeepsItsSignalsFolderAndLocale)
{
    const State before;
    EXPECT_EQ(ChildRun(kWhole).GetVerdict(), ASSAY_HOST_COMPLETE);
    EXPECT_EQ(ChildRun({"abort"}).GetVerdict(), ASSAY_HOST_CRASHED);
    EXPECT_TRUE(State() == before);
}

TEST(LibraryHost, MayIgnoreSigchld)
{
    const auto before = std::signal(SIGCHLD, SIG_IGN);
    const ChildRun run(kWhole + Words{"exit", "7"});
    int status = -1;
    assay_host_result_exit_status(run.fResult, &status);
    EXPECT_EQ(status, 7);
    EXPECT_EQ(ChildRun({"abort"}).GetVerdict(), ASSAY_HOST_CRASHED);
    std::signal(SIGCHLD, before);
}

TEST(LibraryHost, MayHaveClosedItsStandardStreams)
{
    int kept[3];
    for (int stream = 0; stream < 3; ++stream) {
        kept[stream] = ::fcntl(stream, F_DUPFD_CLOEXEC, 10);
        ::close(stream);
    }
    const assay_host_verdict verdict = ChildRun(kWhole).GetVerdict();
    const StateFolder folder;
    const std::string advice = ChildAdvice(folder).Show();
    for (int stream = 0; stream < 3; ++stream) {
        EXPECT_EQ(::fcntl(stream, F_GETFD), -1) << stream << " is in use";
        ::dup2(kept[stream], stream);
        ::close(kept[stream]);
    }
    EXPECT_EQ(verdict, ASSAY_HOST_COMPLETE);
    EXPECT_EQ(advice, "hardware attempt tried");
}

TEST(LibraryHost, IsLeftAsItIsByAnAdvice)
{
    const auto handler = std::signal(SIGCHLD, SIG_IGN);
    const State before;
    const StateFolder folder;
    EXPECT_EQ(ChildAdvice(folder).Show(), "hardware attempt tried");
    EXPECT_EQ(ChildAdvice(folder).Show(), "hardware memory");
    const StateFolder other;
    EXPECT_EQ(ChildAdvice(other, kCrashes).Show(), "broken attempt tried");
    EXPECT_TRUE(State() == before);
    std::signal(SIGCHLD, handler);
}

// A callback must not throw. It stands for any failure in this process during an attempt.
TEST(LibraryHost, AnExceptionOfACallbackClosesTheAttempt)
{
    const StateFolder folder;
    Options options;
    options.OnLine([](const std::string&) -> int { throw std::runtime_error("a failure"); });
    const ChildAdvice failed(folder, kWorks, options);
    EXPECT_EQ(failed.fError, ASSAY_HOST_INTERNAL);
    EXPECT_EQ(failed.fAdvice, nullptr);
    const Options atOnce;
    assay_host_options_set_wait(atOnce, 0);
    const ChildAdvice later(folder, kWorks, atOnce);
    EXPECT_EQ(later.Show(), "hardware attempt tried");
    EXPECT_STREQ(assay_host_advice_warning(later.fAdvice, ASSAY_HOST_OPENGL), "");
}

// Whatever the caller's variable had before.
TEST(LibraryHost, AFailureLeavesNoResultAndNoAdvice)
{
    Options options;
    options.OnLine([](const std::string&) -> int { throw std::runtime_error("a failure"); });
    for (const std::string& word : kWhole)
        assay_host_options_add_argument(options, word.c_str());
    auto* result = reinterpret_cast<assay_host_result*>(&options);
    EXPECT_EQ(assay_host_run(options, nullptr, &result), ASSAY_HOST_INTERNAL);
    EXPECT_EQ(result, nullptr);
    const StateFolder folder;
    auto* advice = reinterpret_cast<assay_host_advice*>(&options);
    EXPECT_EQ(assay_host_advise(options, folder.Get(), nullptr, &advice), ASSAY_HOST_INTERNAL);
    EXPECT_EQ(advice, nullptr);
}

// Threads that the library starts never run a handler of the host.
TEST(LibraryHost, SignalsGoToItsOwnThreads)
{
    static thread_local bool isOwn = false;
    static std::atomic<int> foreign{0};
    static std::atomic<int> own{0};
    isOwn = true;
    foreign = own = 0;
    const auto before = std::signal(SIGUSR1, [](int) { ++(isOwn ? own : foreign); });
    Options options;
    options.OnLine([](const std::string&) {
        // The process's signals go to any thread that doesn't block them.
        sigset_t mask;
        sigset_t old;
        ::sigemptyset(&mask);
        ::sigaddset(&mask, SIGUSR1);
        ::pthread_sigmask(SIG_BLOCK, &mask, &old);
        ::kill(::getpid(), SIGUSR1);
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        ::pthread_sigmask(SIG_SETMASK, &old, nullptr);
        return 0;
    });
    EXPECT_EQ(ChildRun(kWhole, options).GetVerdict(), ASSAY_HOST_COMPLETE);
    std::signal(SIGUSR1, before);
    EXPECT_EQ(foreign, 0);
    EXPECT_GT(own, 0);
}

TEST(LibraryHost, MayHaveTwoGibibytesResident)
{
    if (std::getenv("ASSAY_LONG_TESTS") == nullptr)
        GTEST_SKIP() << "takes 2 GiB of memory: ASSAY_LONG_TESTS=1";
    constexpr std::size_t kBytes = std::size_t{2} << 30;
    void* const memory = ::mmap(nullptr, kBytes, PROT_READ | PROT_WRITE,
                                MAP_PRIVATE | MAP_ANONYMOUS | MAP_POPULATE, -1, 0);
    ASSERT_NE(memory, MAP_FAILED);
    EXPECT_EQ(ChildRun(kWhole).GetVerdict(), ASSAY_HOST_COMPLETE);
    ::munmap(memory, kBytes);
}

} // namespace
