#include <windows.h>

#include <gtest/gtest.h>

#include "qgf/Core.h"

namespace {

bool Opens(const char* name)
{
    const char* const names[] = {name, nullptr};
    try {
        return QGF::Core::OpenLibrary(names) != nullptr;
    } catch (const QGF::LogicalException&) {
        return false;
    }
}

TEST(OpenLibrary, OpensTheFirstThatExists)
{
    const char* const names[] = {"no-such-library", "version.dll", nullptr};
    const auto library = QGF::Core::OpenLibrary(names);
    EXPECT_NE(library->getProc("GetFileVersionInfoW"), nullptr);
    EXPECT_EQ(library->getProc("NoSuchFunction"), nullptr);
}

// The library exists only in the program's folder; it is a copy of a system library.
TEST(OpenLibrary, IgnoresTheProgramsFolder)
{
    wchar_t system[MAX_PATH] = {};
    ASSERT_NE(GetSystemDirectoryW(system, MAX_PATH), 0U);
    wchar_t program[MAX_PATH] = {};
    ASSERT_NE(GetModuleFileNameW(nullptr, program, MAX_PATH), 0U);
    const std::wstring folder = std::wstring(program).substr(0, std::wstring(program).rfind(L'\\'));
    const std::wstring copy = folder + L"\\qgf-planted-test.dll";
    ASSERT_NE(CopyFileW((std::wstring(system) + L"\\version.dll").c_str(), copy.c_str(), FALSE), 0);
    EXPECT_FALSE(Opens("qgf-planted-test.dll"));
    const HMODULE found = LoadLibraryW(L"qgf-planted-test.dll");
    EXPECT_NE(found, nullptr) << "the copy can't be loaded at all";
    if (found != nullptr)
        FreeLibrary(found);
    DeleteFileW(copy.c_str());
}

} // namespace
