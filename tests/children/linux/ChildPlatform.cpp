#include "ChildPlatform.h"

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <pthread.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

namespace {

constexpr int kMaxDescriptors = 1024; // more than any test opens

} // namespace

void PrepareStreams()
{
    const rlimit none{};
    ::setrlimit(RLIMIT_CORE, &none);
}

std::vector<std::string> GetArguments(int argc, char** argv)
{
    return {argv, argv + argc};
}

std::size_t ReadInput(char* bytes, std::size_t size)
{
    const ssize_t count = ::read(STDIN_FILENO, bytes, size);
    return count > 0 ? static_cast<std::size_t>(count) : 0;
}

void ExitNow(int code)
{
    std::fflush(stdout);
    ::_exit(code);
}

void CrashNow()
{
    std::abort();
}

void DieOf(const std::string& /*how*/) {}

void CloseOutputs()
{
    ::close(STDOUT_FILENO);
    ::close(STDERR_FILENO);
}

void SpawnGrandchild(const std::vector<std::string>& command)
{
    std::vector<char*> argv;
    for (const std::string& word : command)
        argv.push_back(const_cast<char*>(word.c_str()));
    argv.push_back(nullptr);
    ::posix_spawn(nullptr, argv[0], nullptr, nullptr, argv.data(), ::environ);
}

void WriteCommandLine() {}

std::string GetOwnPath()
{
    char path[4096] = {};
    return ::readlink("/proc/self/exe", path, sizeof path - 1) < 0 ? "" : path;
}

int CountPipes()
{
    int count = 0;
    struct stat status = {};
    for (int descriptor = 0; descriptor < kMaxDescriptors; ++descriptor)
        count += ::fstat(descriptor, &status) == 0 && S_ISFIFO(status.st_mode);
    return count;
}

void EndFirstThread()
{
    std::thread([] {
        for (;;)
            ::pause();
    }).detach();
    ::pthread_exit(nullptr);
}

void WriteState()
{
    std::printf("descriptors");
    for (int descriptor = 0; descriptor < kMaxDescriptors; ++descriptor)
        if (::fcntl(descriptor, F_GETFD) != -1)
            std::printf(" %d", descriptor);
    std::printf("\n");
    sigset_t mask;
    ::sigprocmask(SIG_BLOCK, nullptr, &mask);
    int blocked = 0;
    int changed = 0;
    for (int number = 1; number <= SIGRTMAX; ++number) {
        struct sigaction action = {};
        ::sigaction(number, nullptr, &action);
        blocked += ::sigismember(&mask, number) == 1;
        changed += action.sa_handler != SIG_DFL;
    }
    std::printf("signals blocked %d changed %d\n", blocked, changed);
    std::fflush(stdout);
}
