#include "pmutil/WinHandle.h"

#include <windows.h>
#include <winioctl.h>

#include "HandleChannelTests.h"
#include "Throws.h"
#include "pmutil/Fmt.h"
#include "win/ReplacedImport.h"

using namespace pmutil;

namespace {

struct Win {
    using Channel = WinHandle;
    using Calls = WinCalls;

    static constexpr char kOpenFailed[] = "CreateFileW failed";
    static constexpr char kReadFailed[] = "ReadFile failed";
    static constexpr char kWriteFailed[] = "WriteFile failed";
    static constexpr char kBrokenPipe[] = "WriteFile failed";
    static constexpr char kSeekFailed[] = "SetFilePointerEx failed";
    static constexpr char kSetEndFailed[] = "SetEndOfFile failed";

    static void MakePipe(HANDLE& readEnd, HANDLE& writeEnd)
    {
        ASSERT_NE(::CreatePipe(&readEnd, &writeEnd, nullptr, 0), 0);
    }

    static bool Exists(const std::wstring& path)
    {
        return ::GetFileAttributesW(path.c_str()) != INVALID_FILE_ATTRIBUTES;
    }

    static std::wstring PathOf(HANDLE handle)
    {
        wchar_t path[MAX_PATH] = {};
        EXPECT_NE(::GetFinalPathNameByHandleW(handle, path, MAX_PATH, 0), 0U);
        return path;
    }

    static bool MakeSparse(WinHandle& file)
    {
        DWORD count = 0;
        ::DeviceIoControl(file.GetHandle(), FSCTL_SET_SPARSE, nullptr, 0, nullptr, 0, &count,
                          nullptr);
        // Wine's files are those of Linux, which are sparse by default.
        return true;
    }

    static std::string ClosingText(HANDLE handle)
    {
        std::string text;
        Fmt::ToText(text, static_cast<const void*>(handle));
        return "WinHandle::Reset closing " + text + "\n";
    }
};

INSTANTIATE_TYPED_TEST_SUITE_P(Win, HandleChannelTest, Win);

TEST(WinHandle, TemporaryDirectoryIsTheUsersFolder)
{
    wchar_t buffer[MAX_PATH] = {};
    ASSERT_NE(::GetTempPathW(MAX_PATH, buffer), 0U);
    EXPECT_EQ(WinHandle::GetTemporaryDirectory(), buffer);
}

TEST(WinHandle, TemporaryDirectoryThatIsTooLongFails)
{
    const std::wstring usual = WinHandle::GetTemporaryDirectory();
    wchar_t variable[MAX_PATH + 2] = {};
    ASSERT_NE(::GetEnvironmentVariableW(L"TMP", variable, MAX_PATH), 0U);
    ::SetEnvironmentVariableW(L"TMP", (L"C:\\" + std::wstring(257, L'x')).c_str());
    EXPECT_TRUE(ThrowsRuntimeError("GetTempPathW failed", [] {
        WinHandle::GetTemporaryDirectory();
    })) << "260 characters and the backslash after them";
    ::SetEnvironmentVariableW(L"TMP", variable);
    EXPECT_EQ(WinHandle::GetTemporaryDirectory(), usual);
}

// The maximum of one system call; the caller repeats it for the rest.
TEST(WinHandle, RequestsAboveFourGigabytesAskForAllThatACallTakes)
{
    static std::vector<DWORD> asked;
    asked.clear();
    WinHandle channel(::GetStdHandle(STD_OUTPUT_HANDLE), false);
    constexpr std::uint64_t kMost = 0xFFFFFFFF;
    char bytes[1] = {};
    {
        const ReplacedImport write(
            __imp_WriteFile, +[](HANDLE, LPCVOID, DWORD size, LPDWORD count, LPOVERLAPPED) -> BOOL {
                asked.push_back(size);
                *count = size;
                return TRUE;
            });
        EXPECT_EQ(channel.WriteSome(bytes, kMost + 6), kMost);
        EXPECT_EQ(channel.WriteSome(bytes, kMost - 1), kMost - 1);
        channel.WriteAll(bytes, 2 * kMost + 6);
    }
    {
        const ReplacedImport read(
            __imp_ReadFile, +[](HANDLE, LPVOID, DWORD size, LPDWORD count, LPOVERLAPPED) -> BOOL {
                asked.push_back(size);
                *count = size;
                return TRUE;
            });
        EXPECT_EQ(channel.ReadSome(bytes, kMost + 6), kMost);
    }
    EXPECT_EQ(asked,
              (std::vector<DWORD>{0xFFFFFFFF, 0xFFFFFFFE, 0xFFFFFFFF, 0xFFFFFFFF, 6, 0xFFFFFFFF}));
}

TEST(WinHandle, StandardChannelsStandOverTheProcessesHandles)
{
    EXPECT_EQ(dynamic_cast<WinHandle&>(WinHandle::GetStandardOutput()).GetHandle(),
              ::GetStdHandle(STD_OUTPUT_HANDLE));
}

} // namespace
