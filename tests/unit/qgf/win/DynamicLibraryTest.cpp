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

TEST(OpenLibrary, OpensTheFirstThatIsThere)
{
    const char* const names[] = {"no-such-library", "version.dll", nullptr};
    const auto library = QGF::Core::OpenLibrary(names);
    EXPECT_NE(library->getProc("GetFileVersionInfoW"), nullptr);
    EXPECT_EQ(library->getProc("NoSuchFunction"), nullptr);
}

// A library that only the folder of the program has, as a copy of one of the system's.
TEST(OpenLibrary, TakesNothingFromTheProgramsFolder)
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
    EXPECT_NE(found, nullptr) << "it wasn't there to be found";
    if (found != nullptr)
        FreeLibrary(found);
    DeleteFileW(copy.c_str());
}

} // namespace
