// A supervised launch against the bare system calls: of a child that does nothing, and of one that
// writes 1 GiB. With RESIDENT_BYTES set, in a process that holds that much memory.
#include <array>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <benchmark/benchmark.h>
#include <boost/make_shared.hpp>

#include "pmutil/ConsoleAppLauncher.h"
#include "pmutil/OutputTask.h"

namespace {

constexpr std::size_t kBlock = 64 * 1024;
constexpr std::uint64_t kFlood = 1ULL << 30;
constexpr int kWidePipe = 1 << 20;

// Starts the benchmarks' child with its output on `output`, unless that is -1.
pid_t Spawn(std::vector<std::string> words, int output)
{
    std::vector<char*> argv;
    for (std::string& word : words)
        argv.push_back(word.data());
    argv.push_back(nullptr);
    posix_spawn_file_actions_t actions;
    ::posix_spawn_file_actions_init(&actions);
    if (output >= 0)
        ::posix_spawn_file_actions_adddup2(&actions, output, STDOUT_FILENO);
    pid_t child = -1;
    if (::posix_spawn(&child, argv[0], &actions, nullptr, argv.data(), ::environ) != 0)
        child = -1;
    ::posix_spawn_file_actions_destroy(&actions);
    return child;
}

bool Await(pid_t child)
{
    int status = -1;
    return child >= 0 && ::waitpid(child, &status, 0) == child && status == 0;
}

pmutil::ConsoleAppLauncher MakeLauncher(const boost::shared_ptr<pmutil::OutputTask>& task,
                                        std::deque<std::string> args)
{
    pmutil::ConsoleAppLauncher launcher;
    launcher.SetConsoleApp(boost::make_shared<pmutil::ConsoleApp>());
    launcher.SetLaunchParams(
        pmutil::LaunchParams(task, nullptr, std::move(args), BENCHMARK_CHILD_WIDE));
    return launcher;
}

bool Run(pmutil::ConsoleAppLauncher& launcher)
{
    int exitCode = -1;
    return launcher.LaunchAndWait(&exitCode, 600.0) == pmutil::State::kFinished && exitCode == 0;
}

void BareSpawn(benchmark::State& state)
{
    for (auto _ : state)
        if (!Await(Spawn({BENCHMARK_CHILD}, -1)))
            state.SkipWithError("the child failed");
}

// The system calls of a launch: three pipes for the child, the default signals, no other
// descriptors, and a process descriptor to wait for its end.
bool SpawnOnPipes()
{
    std::array<std::array<int, 2>, 3> pipes{};
    for (auto& pipe : pipes)
        if (::pipe2(pipe.data(), O_CLOEXEC) != 0)
            return false;
    ::fcntl(pipes[STDOUT_FILENO][1], F_SETPIPE_SZ, kWidePipe);
    const std::array<int, 3> childEnds{pipes[0][0], pipes[1][1], pipes[2][1]};
    const std::array<int, 3> ownEnds{pipes[0][1], pipes[1][0], pipes[2][0]};

    posix_spawn_file_actions_t actions;
    ::posix_spawn_file_actions_init(&actions);
    for (int stream = 0; stream < 3; ++stream)
        ::posix_spawn_file_actions_adddup2(&actions, childEnds[static_cast<std::size_t>(stream)],
                                           stream);
    ::posix_spawn_file_actions_addclosefrom_np(&actions, 3);
    posix_spawnattr_t attributes;
    ::posix_spawnattr_init(&attributes);
    sigset_t all;
    sigset_t none;
    ::sigfillset(&all);
    ::sigemptyset(&none);
    ::posix_spawnattr_setsigdefault(&attributes, &all);
    ::posix_spawnattr_setsigmask(&attributes, &none);
    ::posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETSIGMASK);

    std::string program = BENCHMARK_CHILD;
    std::array<char*, 2> argv{program.data(), nullptr};
    pid_t child = -1;
    const int failure =
        ::posix_spawn(&child, argv[0], &actions, &attributes, argv.data(), ::environ);
    ::posix_spawn_file_actions_destroy(&actions);
    ::posix_spawnattr_destroy(&attributes);
    for (const int end : childEnds)
        ::close(end);
    siginfo_t info{};
    bool ended = false;
    if (failure == 0) {
        const int process = static_cast<int>(::syscall(SYS_pidfd_open, child, 0));
        pollfd poll{process, POLLIN, 0};
        ended = ::poll(&poll, 1, -1) == 1 &&
                ::waitid(P_PIDFD, static_cast<id_t>(process), &info, WEXITED) == 0;
        ::close(process);
    }
    for (const int end : ownEnds)
        ::close(end);
    return ended && info.si_code == CLD_EXITED && info.si_status == 0;
}

// The least that a launch on a thread of its own takes.
void ThreadSpawn(benchmark::State& state)
{
    for (auto _ : state) {
        bool ended = false;
        std::thread([&] { ended = SpawnOnPipes(); }).join();
        if (!ended)
            state.SkipWithError("the child failed");
    }
}

void LaunchAndWait(benchmark::State& state)
{
    pmutil::ConsoleAppLauncher launcher = MakeLauncher(nullptr, {});
    for (auto _ : state)
        if (!Run(launcher))
            state.SkipWithError("the child failed");
}

void PumpBare(benchmark::State& state, int pipeBytes)
{
    for (auto _ : state) {
        int ends[2];
        if (::pipe2(ends, O_CLOEXEC) != 0) {
            state.SkipWithError("no pipe");
            return;
        }
        if (pipeBytes != 0)
            ::fcntl(ends[1], F_SETPIPE_SZ, pipeBytes);
        const pid_t child = Spawn({BENCHMARK_CHILD, std::to_string(kFlood)}, ends[1]);
        ::close(ends[1]);
        std::vector<char> block(kBlock);
        std::uint64_t total = 0;
        for (ssize_t count = ::read(ends[0], block.data(), block.size()); count > 0;
             count = ::read(ends[0], block.data(), block.size()))
            total += static_cast<std::uint64_t>(count);
        ::close(ends[0]);
        if (!Await(child) || total != kFlood)
            state.SkipWithError("the child failed");
    }
}

void PumpBareReads(benchmark::State& state)
{
    PumpBare(state, 0);
}

void PumpBareReadsOfAWidePipe(benchmark::State& state)
{
    PumpBare(state, kWidePipe);
}

class CountingTask : public pmutil::OutputTask {
public:
    std::uint64_t fTotal = 0;

protected:
    void DoRun() override
    {
        fTotal = 0;
        const boost::shared_ptr<pmutil::Reader> reader = GetReader();
        std::vector<char> block(kBlock);
        while (const std::uint64_t count = reader->ReadSome(block.data(), block.size()))
            fTotal += count;
    }
};

void PumpTask(benchmark::State& state)
{
    const auto task = boost::make_shared<CountingTask>();
    pmutil::ConsoleAppLauncher launcher = MakeLauncher(task, {std::to_string(kFlood)});
    for (auto _ : state)
        if (!Run(launcher) || task->fTotal != kFlood)
            state.SkipWithError("the child failed");
}

// Memory that is there, page by page.
std::unique_ptr<char[]> Occupy(std::size_t bytes)
{
    std::unique_ptr<char[]> memory(new char[bytes + 1]);
    std::memset(memory.get(), 'x', bytes + 1);
    benchmark::DoNotOptimize(memory.get());
    return memory;
}

} // namespace

BENCHMARK(BareSpawn)->UseRealTime();
BENCHMARK(ThreadSpawn)->UseRealTime();
BENCHMARK(LaunchAndWait)->UseRealTime();

int main(int argc, char** argv)
{
    const std::unique_ptr<char[]> resident = Occupy(RESIDENT_BYTES);
    if (RESIDENT_BYTES == 0)
        for (const auto& [name, function] : {std::pair{"PumpBareReads", PumpBareReads},
                                             {"PumpBareReadsOfAWidePipe", PumpBareReadsOfAWidePipe},
                                             {"PumpTask", PumpTask}})
            benchmark::RegisterBenchmark(name, function)->UseRealTime();
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    return EXIT_SUCCESS;
}
