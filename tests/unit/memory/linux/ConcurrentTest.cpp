// Many calls at once on a real folder, by threads of one process.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include <boost/filesystem/operations.hpp>

#include "Samples.h"
#include "memory/Adviser.h"

namespace assay_host {
namespace {

TEST(ConcurrentTest, CallsOfThreadsShareOneAttempt)
{
    constexpr int kThreads = 16;
    const boost::filesystem::path path = boost::filesystem::temp_directory_path() /
                                         boost::filesystem::unique_path("assay-memory-%%%%-%%%%");
    const Identity identity = MakeIdentity();
    std::atomic<int> attempts{0};
    std::atomic<int> inside{0};
    std::atomic<int> good{0};
    const auto call = [&] {
        const auto folder = OpenFolder(path.native(), FolderUse::kWrite);
        const auto machine = MakeSystemMachine();
        AdviceRequest request;
        request.fWaitSeconds = 1e9;
        const Advice advice = Adviser(*folder, *machine, identity, request)
                                  .Advise(
                                      [&](Attempt& attempt) {
                                          EXPECT_EQ(++inside, 1);
                                          ++attempts;
                                          const HostMark host = attempt.fHost;
                                          attempt =
                                              MakeAttempt(machine->GetTime(), AttemptEnd::kEnded,
                                                          Usability::kHardware, Usability::kAbsent);
                                          attempt.fHost = host;
                                          --inside;
                                      },
                                      [](double) {
                                          std::this_thread::yield();
                                          return true;
                                      });
        if (advice.fOpenGL.GetUsability() == Usability::kHardware && advice.fMessages.empty())
            ++good;
    };
    std::vector<std::thread> threads;
    for (int thread = 0; thread < kThreads; ++thread)
        threads.emplace_back(call);
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(attempts, 1);
    EXPECT_EQ(good, kThreads);
    boost::filesystem::remove_all(path);
}

} // namespace
} // namespace assay_host
