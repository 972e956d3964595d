#include "memory/win/Owner.h"

#include <gtest/gtest.h>

#include <boost/filesystem/operations.hpp>

namespace assay_host {
namespace {

bool IsTrusted(WELL_KNOWN_SID_TYPE kind)
{
    BYTE sid[SECURITY_MAX_SID_SIZE];
    DWORD size = sizeof sid;
    EXPECT_NE(::CreateWellKnownSid(kind, nullptr, sid, &size), 0);
    return IsTrustedOwner(sid);
}

TEST(OwnerTest, TrustsThoseThatCanChangeAnyFile)
{
    EXPECT_TRUE(IsTrusted(WinBuiltinAdministratorsSid));
    EXPECT_TRUE(IsTrusted(WinLocalSystemSid));
}

TEST(OwnerTest, TrustsNoOthers)
{
    EXPECT_FALSE(IsTrusted(WinBuiltinGuestsSid));
    EXPECT_FALSE(IsTrusted(WinBuiltinUsersSid));
    EXPECT_FALSE(IsTrusted(WinWorldSid));
    EXPECT_FALSE(IsTrusted(WinLocalServiceSid));
}

TEST(OwnerTest, TrustsANewFileOfThisProcess)
{
    const auto path = boost::filesystem::temp_directory_path() /
                      boost::filesystem::unique_path("assay-owner-%%%%-%%%%");
    const HANDLE file = ::CreateFileW(path.c_str(), GENERIC_READ | GENERIC_WRITE, 0, nullptr,
                                      CREATE_NEW, FILE_FLAG_DELETE_ON_CLOSE, nullptr);
    ASSERT_NE(file, INVALID_HANDLE_VALUE);
    EXPECT_EQ(CheckOwner(file), "");
    ::CloseHandle(file);
}

TEST(OwnerTest, SaysWhyAnOwnerCannotBeRead)
{
    EXPECT_NE(CheckOwner(nullptr), "");
    EXPECT_NE(CheckOwner(nullptr), "it belongs to another user");
}

} // namespace
} // namespace assay_host
