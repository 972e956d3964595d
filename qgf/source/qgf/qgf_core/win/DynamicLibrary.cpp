#include <string>

#include <windows.h>

#include "qgf/Core.h"
#include "qgf/qgf_core/LibraryLoader.h"
#include "qgf/qgf_core/win/SystemError.h"

namespace QGF {
namespace Core {

namespace {

class Module : public DynamicLibrary {
public:
    explicit Module(HMODULE handle) : fHandle(handle) {}
    ~Module() override { FreeLibrary(fHandle); }
    Module(const Module&) = delete;
    Module& operator=(const Module&) = delete;

    Proc getProc(const char* name) const override
    {
        return reinterpret_cast<Proc>(GetProcAddress(fHandle, name));
    }

private:
    HMODULE fHandle;
};

} // namespace

std::unique_ptr<DynamicLibrary> OpenLibrary(const char* const* names)
{
    std::string reasons;
    for (; *names != nullptr; ++names) {
        // Search the system folder only, also for the library's dependencies: a file of that name
        // in the program's folder, the current directory or on the PATH must not be loaded.
        if (const HMODULE handle = LoadLibraryExA(*names, nullptr, LOAD_LIBRARY_SEARCH_SYSTEM32))
            return std::make_unique<Module>(handle);
        const DWORD error = GetLastError();
        if (!reasons.empty())
            reasons += "; ";
        reasons += std::string(*names) + " can't be opened (" + SystemErrorText(error) + ")";
    }
    throw LogicalException(reasons.empty() ? "No library was named" : reasons);
}

void CheckNativeLoader()
{
    if (GetModuleHandleW(nullptr) == nullptr)
        throw LogicalException("The loader can't name the program itself (" +
                               SystemErrorText(GetLastError()) + ")");
}

} // namespace Core
} // namespace QGF
