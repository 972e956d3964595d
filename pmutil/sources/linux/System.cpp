#include "pmutil/System.h"

#include <fcntl.h>
#include <pthread.h>
#include <pwd.h>
#include <stdio_ext.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <fstream>
#include <stdexcept>
#include <vector>

#include <boost/filesystem/detail/utf8_codecvt_facet.hpp>
#include <boost/filesystem/operations.hpp>

#include "all/PathCodecvt.h"
#include "linux/UserDirs.h"

namespace pmutil {

namespace {

thread_local std::uint64_t gThreadNumber = 0;

void ForgetThreadNumber()
{
    gThreadNumber = 0;
}

// Rejects surrogates and codes above U+10FFFF, which Boost's facet would encode.
class PathFacet : public boost::filesystem::detail::utf8_codecvt_facet {
public:
    PathFacet() : utf8_codecvt_facet(1) {} // 1: a locale doesn't delete it

protected:
    result do_out(std::mbstate_t& state, const wchar_t* from, const wchar_t* fromEnd,
                  const wchar_t*& fromNext, char* to, char* toEnd, char*& toNext) const override
    {
        if (std::all_of(from, fromEnd, IsCharacter))
            return utf8_codecvt_facet::do_out(state, from, fromEnd, fromNext, to, toEnd, toNext);
        fromNext = from;
        toNext = to;
        return error;
    }

private:
    // wchar_t has a sign on some processors only.
    static bool IsCharacter(wchar_t character)
    {
        const auto code = static_cast<char32_t>(character);
        return code < 0xD800 || (code >= 0xE000 && code <= 0x10FFFF);
    }
};

// Empty if the user isn't in the password database.
std::string GetHomeFolder()
{
    std::vector<char> buffer(64);
    passwd entry{};
    passwd* found = nullptr;
    int status = 0;
    while ((status = getpwuid_r(getuid(), &entry, buffer.data(), buffer.size(), &found)) == ERANGE)
        buffer.resize(2 * buffer.size());
    return status == 0 && found != nullptr && found->pw_dir != nullptr ? found->pw_dir : "";
}

std::string GetNarrowDesktopFolder()
{
    const std::string home = GetHomeFolder();
    if (home.empty())
        return {};
    std::ifstream file(home + "/.config/user-dirs.dirs", std::ios::binary);
    const std::string named = FindDesktopDir(file, home);
    return named.empty() ? home + "/Desktop" : named;
}

// With a soft limit of 1 the kernel dumps no core, neither to a file nor to the program of
// core_pattern, which opens the crash dialogs of desktops. A limit of 0 prevents files only.
void PreventCoreDump()
{
    rlimit limit{};
    getrlimit(RLIMIT_CORE, &limit);
    limit.rlim_cur = 1;
    limit.rlim_max = std::max<rlim_t>(limit.rlim_max, 1);
    // Only a privileged process may raise a hard limit of 0; for others there is no dump then.
    setrlimit(RLIMIT_CORE, &limit);
}

// Resets signal dispositions and the signal mask, which are inherited through exec.
void PrepareSignals()
{
    // With these ignored, a write to a pipe without a reader and a write beyond the file-size limit
    // fail, and a write to the terminal of another job succeeds.
    for (const int number : {SIGPIPE, SIGXFSZ, SIGTTOU})
        std::signal(number, SIG_IGN);
    // A crash must end the process, and drivers wait for their child processes. Keep a handler: it
    // belongs to a sanitizer.
    for (const int number : {SIGABRT, SIGBUS, SIGCHLD, SIGFPE, SIGILL, SIGSEGV, SIGSYS, SIGTRAP}) {
        struct sigaction action = {};
        sigaction(number, nullptr, &action);
        if (action.sa_handler == SIG_IGN)
            std::signal(number, SIG_DFL);
    }
    sigset_t none;
    sigemptyset(&none);
    pthread_sigmask(SIG_SETMASK, &none, nullptr);
}

// Without this, a file that a driver opens would get the number of a closed standard stream, and
// the report would be written to it. An O_PATH descriptor fails reads and writes with EBADF, like a
// closed stream.
void OccupyClosedStreams()
{
    for (int stream = STDIN_FILENO; stream <= STDERR_FILENO; ++stream)
        if (fcntl(stream, F_GETFD) < 0)
            open("/", O_PATH);
}

} // namespace

std::uint64_t GetCurrentThreadNumber()
{
    // Cached, since a system call per log line would cost more than the rest of the prefix. A fork
    // changes the number.
    static const int registered = pthread_atfork(nullptr, nullptr, ForgetThreadNumber);
    if (gThreadNumber != 0 && registered == 0)
        return gThreadNumber;
    gThreadNumber = static_cast<std::uint64_t>(syscall(SYS_gettid));
    return gThreadNumber;
}

void ShowThreadName(const std::string& name)
{
    constexpr std::size_t kMaxBytes = 15; // the kernel's limit
    // Don't rename the first thread: its name is the process's name.
    if (GetCurrentThreadNumber() != static_cast<std::uint64_t>(getpid()))
        pthread_setname_np(pthread_self(), name.substr(0, kMaxBytes).c_str());
}

std::uint64_t GetPhysicalMemoryBytes()
{
    const long pages = sysconf(_SC_PHYS_PAGES);
    const long pageSize = sysconf(_SC_PAGESIZE);
    if (pages <= 0 || pageSize <= 0)
        throw std::runtime_error("GlobalMemoryStatusEx failed");
    return static_cast<std::uint64_t>(pages) * static_cast<std::uint64_t>(pageSize);
}

std::wstring GetDesktopFolder()
{
    try {
        return boost::filesystem::path(GetNarrowDesktopFolder()).wstring(GetPathCodecvt());
    } catch (const boost::system::system_error&) {
        return {}; // a name that isn't UTF-8
    }
}

std::wstring GetCurrentDirectoryPath()
{
    try {
        return boost::filesystem::current_path().wstring(GetPathCodecvt());
    } catch (const boost::system::system_error&) {
        throw std::runtime_error("GetCurrentDirectoryW failed");
    }
}

std::FILE* OpenSharedAppend(const std::string& path)
{
    return std::fopen(path.c_str(), "ae");
}

void DiscardUnwritten(std::FILE* stream)
{
    __fpurge(stream);
    std::clearerr(stream);
}

void PrepareConsoleProcess()
{
    PreventCoreDump();
    PrepareSignals();
    OccupyClosedStreams();
}

const boost::filesystem::path::codecvt_type& GetPathCodecvt()
{
    static const boost::filesystem::path::codecvt_type& facet = *new PathFacet; // never destroyed
    return facet;
}

} // namespace pmutil
