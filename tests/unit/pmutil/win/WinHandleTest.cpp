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

// The arguments of CreateFileW.
struct Opening {
    std::wstring path;
    DWORD access = 0;
    DWORD share = 0;
    SECURITY_ATTRIBUTES* security = nullptr;
    DWORD disposition = 0;
    DWORD attributes = 0;
    HANDLE likeFile = nullptr;
};

TEST(WinHandle, FlagsAreThoseOfTheSystem)
{
    static std::vector<Opening> openings;
    openings.clear();
    const ReplacedImport create(
        __imp_CreateFileW,
        +[](LPCWSTR path, DWORD access, DWORD share, SECURITY_ATTRIBUTES* security,
            DWORD disposition, DWORD attributes, HANDLE likeFile) -> HANDLE {
            openings.push_back({path, access, share, security, disposition, attributes, likeFile});
            return INVALID_HANDLE_VALUE;
        });
    const std::wstring path = L"\\\\?\\C:\\" + std::wstring(300, L'x') + L"\u65e5";
    constexpr DWORD kAccess[] = {0x80000000, 0x40000000, 0xC0000000};
    constexpr DWORD kDispositions[] = {3, 5, 4, 2};
    for (int access = kOpenRead; access <= kOpenReadWrite; ++access) {
        for (int creation = kOpenExisting; creation <= kCreateAlways; ++creation) {
            EXPECT_TRUE(ThrowsRuntimeError("CreateFileW failed",
                                           [&] { WinCalls::Open(path, access, creation); }));
            const Opening& last = openings.back();
            EXPECT_EQ(last.path, path);
            EXPECT_EQ(last.access, kAccess[access - kOpenRead]);
            EXPECT_EQ(last.share, 7U);
            EXPECT_EQ(last.security, nullptr);
            EXPECT_EQ(last.disposition, kDispositions[creation - kOpenExisting]);
            EXPECT_EQ(last.attributes, 0x80U);
            EXPECT_EQ(last.likeFile, nullptr);
        }
    }
    EXPECT_EQ(openings.size(), 12U);
}

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
    constexpr std::uint64_t kMaxPerCall = 0xFFFFFFFF;
    char bytes[1] = {};
    {
        const ReplacedImport write(
            __imp_WriteFile, +[](HANDLE, LPCVOID, DWORD size, LPDWORD count, LPOVERLAPPED) -> BOOL {
                asked.push_back(size);
                *count = size;
                return TRUE;
            });
        EXPECT_EQ(channel.WriteSome(bytes, kMaxPerCall + 6), kMaxPerCall);
        EXPECT_EQ(channel.WriteSome(bytes, kMaxPerCall - 1), kMaxPerCall - 1);
        channel.WriteAll(bytes, 2 * kMaxPerCall + 6);
    }
    {
        const ReplacedImport read(
            __imp_ReadFile, +[](HANDLE, LPVOID, DWORD size, LPDWORD count, LPOVERLAPPED) -> BOOL {
                asked.push_back(size);
                *count = size;
                return TRUE;
            });
        EXPECT_EQ(channel.ReadSome(bytes, kMaxPerCall + 6), kMaxPerCall);
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
