#include "pmutil/LauncherWin.h"

#include <windows.h>

#include <cstddef>
#include <iomanip>
#include <sstream>
#include <stdexcept>
#include <utility>
#include <vector>

#include <boost/make_shared.hpp>
#include <boost/thread/lock_guard.hpp>

#include "all/BinioLog.h"
#include "pmutil/WinHandle.h"

namespace pmutil {

namespace {

// Larger codes are those of exceptions and of TerminateProcess.
constexpr DWORD kMaxExitCode = 255;
constexpr UINT kKilledCode = 257;

[[noreturn]] void ThrowFailed(const char* call)
{
    throw std::runtime_error(std::string(call) + " failed");
}

// A pipe with one end for the parent and one for the child. Both are inheritable at first.
struct ChildPipe {
    boost::shared_ptr<WinHandle> reader;
    boost::shared_ptr<WinHandle> writer;

    ChildPipe()
        : reader(boost::make_shared<WinHandle>(WinCalls::GetInvalid(), false)),
          writer(boost::make_shared<WinHandle>(WinCalls::GetInvalid(), false))
    {
        SECURITY_ATTRIBUTES attributes = {};
        attributes.nLength = sizeof attributes;
        attributes.bInheritHandle = TRUE;
        HANDLE readEnd = nullptr;
        HANDLE writeEnd = nullptr;
        if (::CreatePipe(&readEnd, &writeEnd, &attributes, 0) == 0)
            ThrowFailed("CreatePipe");
        reader->Reset(readEnd, true);
        writer->Reset(writeEnd, true);
    }
};

void LogPipe(const char* stream, const ChildPipe& pipe)
{
    PM_LOG(gBinioLog, "child" << stream << "Rd=" << pipe.reader->GetHandle() << " child" << stream
                              << "Wr=" << pipe.writer->GetHandle());
}

void KeepFromChild(const WinHandle& end)
{
    if (::SetHandleInformation(end.GetHandle(), HANDLE_FLAG_INHERIT, 0) == 0)
        ThrowFailed("SetHandleInformation");
}

// Windows has it since version 10; the headers declare it for programs that require that version.
constexpr DWORD_PTR kJobListAttribute = 0x0002000D; // PROC_THREAD_ATTRIBUTE_JOB_LIST

// What a child is created with: the list of the handles that it inherits, and the job of which it
// is a member at once. Without the list, the child would inherit all inheritable handles, among
// them the pipes of a simultaneous launch.
class ChildAttributes {
public:
    ChildAttributes(const STARTUPINFOW& startup, HANDLE job)
        : fHandles{startup.hStdInput, startup.hStdOutput, startup.hStdError}, fJob(job)
    {
        constexpr DWORD kAttributes = 2;
        SIZE_T size = 0;
        ::InitializeProcThreadAttributeList(nullptr, kAttributes, 0, &size);
        fMemory.resize(size / sizeof(std::max_align_t) + 1);
        if (::InitializeProcThreadAttributeList(Get(), kAttributes, 0, &size) == 0)
            ThrowFailed("InitializeProcThreadAttributeList");
        if (!Set(PROC_THREAD_ATTRIBUTE_HANDLE_LIST, fHandles, sizeof fHandles)) {
            ::DeleteProcThreadAttributeList(Get());
            ThrowFailed("UpdateProcThreadAttribute");
        }
        fHasJob = job != nullptr && Set(kJobListAttribute, &fJob, sizeof fJob);
    }
    ~ChildAttributes() { ::DeleteProcThreadAttributeList(Get()); }
    ChildAttributes(const ChildAttributes&) = delete;
    ChildAttributes& operator=(const ChildAttributes&) = delete;

    LPPROC_THREAD_ATTRIBUTE_LIST Get()
    {
        return reinterpret_cast<LPPROC_THREAD_ATTRIBUTE_LIST>(fMemory.data());
    }

    // Returns false if the child must be made a member of the job after its creation.
    bool HasJob() const { return fHasJob; }

private:
    bool Set(DWORD_PTR attribute, void* value, SIZE_T size)
    {
        return ::UpdateProcThreadAttribute(Get(), 0, attribute, value, size, nullptr, nullptr) != 0;
    }

    HANDLE fHandles[3];
    HANDLE fJob;
    std::vector<std::max_align_t> fMemory;
    bool fHasJob = false;
};

} // namespace

LauncherWin::LauncherWin() : LauncherWin(nullptr) {}
LauncherWin::LauncherWin(void* job)
    : fJob(job), fProcessInfo(std::make_unique<PROCESS_INFORMATION>())
{}

LauncherWin::~LauncherWin()
{
    CloseJobMember();
}

void LauncherWin::CloseJobMember()
{
    if (fJob != nullptr && fProcessInfo->hProcess != nullptr)
        ::CloseHandle(std::exchange(fProcessInfo->hProcess, nullptr));
}

// Makes the suspended child a member of the job, and lets it run.
void LauncherWin::EnterJob(const PROCESS_INFORMATION& child) const
{
    if (::AssignProcessToJobObject(fJob, child.hProcess) != 0) {
        ::ResumeThread(child.hThread);
        return;
    }
    ::TerminateProcess(child.hProcess, kKilledCode);
    ::CloseHandle(child.hThread);
    ::CloseHandle(child.hProcess);
    ThrowFailed("AssignProcessToJobObject");
}

std::wstring LauncherWin::MakeCommandLine(const std::wstring& program,
                                          const std::deque<std::string>& args)
{
    std::wstring line = program;
    for (const std::string& arg : args) {
        const bool apostrophes =
            arg.find('"') != std::string::npos && arg.find('\'') == std::string::npos;
        const char quote = apostrophes ? '\'' : '"';
        line += L' ';
        line += static_cast<wchar_t>(quote);
        for (const char byte : arg) {
            if (byte == quote)
                line += L'\\';
            line += static_cast<wchar_t>(static_cast<signed char>(byte));
        }
        line += static_cast<wchar_t>(quote);
    }
    return line;
}

LaunchResult LauncherWin::Launch(const std::wstring& program, const std::deque<std::string>& args)
{
    const std::wstring text = MakeCommandLine(program, args);
    std::vector<wchar_t> commandLine(text.begin(), text.end());
    commandLine.push_back(L'\0');

    STARTUPINFOEXW extended = {};
    STARTUPINFOW& startup = extended.StartupInfo;
    startup.cb = sizeof extended;
    startup.dwFlags = STARTF_USESHOWWINDOW;
    startup.wShowWindow = SW_HIDE;
    startup.hStdInput = ::GetStdHandle(STD_INPUT_HANDLE);
    startup.hStdOutput = ::GetStdHandle(STD_OUTPUT_HANDLE);
    startup.hStdError = ::GetStdHandle(STD_ERROR_HANDLE);
    startup.dwFlags |= STARTF_USESTDHANDLES;

    const ChildPipe input;
    KeepFromChild(*input.writer);
    startup.hStdInput = input.reader->GetHandle();
    LogPipe("Stdin", input);
    const ChildPipe output;
    KeepFromChild(*output.reader);
    startup.hStdOutput = output.writer->GetHandle();
    LogPipe("Stdout", output);
    const ChildPipe error;
    KeepFromChild(*error.reader);
    startup.hStdError = error.writer->GetHandle();
    LogPipe("Stderr", error);

    ChildAttributes attributes(startup, fJob);
    extended.lpAttributeList = attributes.Get();
    const bool entersLater = fJob != nullptr && !attributes.HasJob();

    PROCESS_INFORMATION info = {};
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        fKilled = false;
        CloseJobMember();
        *fProcessInfo = info;
        fRawExitCode = 0;
    }
    if (::CreateProcessW(nullptr, commandLine.data(), nullptr, nullptr, TRUE,
                         EXTENDED_STARTUPINFO_PRESENT | (entersLater ? CREATE_SUSPENDED : 0),
                         nullptr, nullptr, &startup, &info) == 0)
        ThrowFailed("CreateProcessW");
    if (entersLater)
        EnterJob(info);
    if (fJob != nullptr)
        ::CloseHandle(std::exchange(info.hThread, nullptr));
    {
        const boost::lock_guard<boost::mutex> lock(fMutex);
        *fProcessInfo = info;
    }

    LaunchResult result;
    result.fAppInput = input.writer;
    result.fAppOutput[static_cast<int>(OutputChannel::kStdout)] = output.reader;
    result.fAppOutput[static_cast<int>(OutputChannel::kStderr)] = error.reader;
    return result;
}

WaitResult LauncherWin::Wait(int* exitCode)
{
    const HANDLE process = GetProcess();
    if (::WaitForSingleObject(process, INFINITE) == WAIT_FAILED)
        ThrowFailed("WaitForSingleObject");
    DWORD code = 0;
    if (::GetExitCodeProcess(process, &code) == 0)
        ThrowFailed("GetExitCodeProcess");
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fRawExitCode = code;
    if (code <= kMaxExitCode) {
        *exitCode = static_cast<int>(code);
        return kEndedNormally;
    }
    return fKilled ? kEndedByKill : kEndedByCrash;
}

void LauncherWin::Kill()
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    fKilled = true;
    if (::TerminateProcess(fProcessInfo->hProcess, kKilledCode) == 0 &&
        ::GetLastError() != ERROR_ACCESS_DENIED)
        ThrowFailed("TerminateProcess");
}

std::uint32_t LauncherWin::GetRawExitCode() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fRawExitCode;
}

void* LauncherWin::GetProcess() const
{
    const boost::lock_guard<boost::mutex> lock(fMutex);
    return fProcessInfo->hProcess;
}

boost::shared_ptr<Launcher> MakeLauncher()
{
    return boost::make_shared<LauncherWin>();
}

std::string GetTerminationText(const Launcher& launcher)
{
    const auto* const own = dynamic_cast<const LauncherWin*>(&launcher);
    const std::uint32_t code = own != nullptr ? own->GetRawExitCode() : 0;
    if (code <= kMaxExitCode)
        return {};
    std::ostringstream text;
    text << "code 0x" << std::hex << std::uppercase << std::setw(8) << std::setfill('0') << code;
    return text.str();
}

} // namespace pmutil
