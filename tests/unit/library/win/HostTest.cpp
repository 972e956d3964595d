// Hosts with unusual states.
#include <windows.h>

#include <clocale>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "Runs.h"

namespace {

constexpr DWORD kStreams[] = {STD_INPUT_HANDLE, STD_OUTPUT_HANDLE, STD_ERROR_HANDLE};

LPTOP_LEVEL_EXCEPTION_FILTER GetFilter()
{
    const LPTOP_LEVEL_EXCEPTION_FILTER filter = ::SetUnhandledExceptionFilter(nullptr);
    ::SetUnhandledExceptionFilter(filter);
    return filter;
}

// What a library must leave as it is.
struct State {
    std::wstring fFolder = std::wstring(32768, L'\0');
    std::string fLocale = std::setlocale(LC_ALL, nullptr);
    UINT fErrorMode = ::GetErrorMode();
    DWORD fThreadErrorMode = ::GetThreadErrorMode();
    LPTOP_LEVEL_EXCEPTION_FILTER fFilter = GetFilter();
    std::vector<HANDLE> fStreams;

    State()
    {
        fFolder.resize(::GetCurrentDirectoryW(static_cast<DWORD>(fFolder.size()), fFolder.data()));
        for (const DWORD stream : kStreams)
            fStreams.push_back(::GetStdHandle(stream));
    }

    bool operator==(const State& other) const
    {
        return fFolder == other.fFolder && fLocale == other.fLocale &&
               fErrorMode == other.fErrorMode && fThreadErrorMode == other.fThreadErrorMode &&
               fFilter == other.fFilter && fStreams == other.fStreams;
    }
};

LONG WINAPI TakeException(EXCEPTION_POINTERS*)
{
    return EXCEPTION_CONTINUE_SEARCH;
}

TEST(LibraryHost, KeepsItsErrorModeFilterFolderLocaleAndStreams)
{
    const UINT mode = ::SetErrorMode(SEM_NOOPENFILEERRORBOX);
    const LPTOP_LEVEL_EXCEPTION_FILTER filter = ::SetUnhandledExceptionFilter(TakeException);
    const State before;
    EXPECT_EQ(ChildRun(kWhole).GetVerdict(), ASSAY_HOST_COMPLETE);
    EXPECT_EQ(ChildRun({"abort"}).GetVerdict(), ASSAY_HOST_CRASHED);
    EXPECT_TRUE(State() == before);
    ::SetUnhandledExceptionFilter(filter);
    ::SetErrorMode(mode);
}

// As a program with windows has none.
TEST(LibraryHost, MayHaveNoStandardStreams)
{
    std::vector<HANDLE> kept;
    for (const DWORD stream : kStreams) {
        kept.push_back(::GetStdHandle(stream));
        ::SetStdHandle(stream, nullptr);
    }
    const assay_host_verdict verdict = ChildRun(kWhole).GetVerdict();
    for (std::size_t index = 0; index < kept.size(); ++index) {
        EXPECT_EQ(::GetStdHandle(kStreams[index]), nullptr);
        ::SetStdHandle(kStreams[index], kept[index]);
    }
    EXPECT_EQ(verdict, ASSAY_HOST_COMPLETE);
}

// The host's own job, as that of a browser's or a service's, doesn't keep the child from its own.
TEST(LibraryHost, MayBeInAJob)
{
    const HANDLE job = ::CreateJobObjectW(nullptr, nullptr);
    ASSERT_NE(::AssignProcessToJobObject(job, ::GetCurrentProcess()), 0);
    const ChildRun run(kWhole + Words{"spawn", "600000"});
    EXPECT_EQ(run.GetVerdict(), ASSAY_HOST_COMPLETE);
    EXPECT_EQ(assay_host_result_left_behind(run.fResult), 0);
    ::CloseHandle(job);
}

} // namespace
