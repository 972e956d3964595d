// Replaces a system call in this program while the object exists.
#pragma once

#include <windows.h>

// The pointers through which the program's own code calls the system.
extern "C" {
extern decltype(&::WriteFile) __imp_WriteFile;
extern decltype(&::ReadFile) __imp_ReadFile;
extern decltype(&::OutputDebugStringA) __imp_OutputDebugStringA;
extern decltype(&::CreateFileW) __imp_CreateFileW;
extern decltype(&::CreatePipe) __imp_CreatePipe;
extern decltype(&::SetHandleInformation) __imp_SetHandleInformation;
extern decltype(&::UpdateProcThreadAttribute) __imp_UpdateProcThreadAttribute;
extern decltype(&::AssignProcessToJobObject) __imp_AssignProcessToJobObject;
}

namespace pmutil {

template <typename Call>
class ReplacedImport {
public:
    ReplacedImport(Call& import, Call replacement) : fImport(import), fBefore(import)
    {
        Set(replacement);
    }
    ~ReplacedImport() { Set(fBefore); }
    ReplacedImport(const ReplacedImport&) = delete;
    ReplacedImport& operator=(const ReplacedImport&) = delete;

private:
    void Set(Call call)
    {
        DWORD protection = 0;
        ::VirtualProtect(&fImport, sizeof fImport, PAGE_READWRITE, &protection);
        fImport = call;
        ::VirtualProtect(&fImport, sizeof fImport, protection, &protection);
    }

    Call& fImport;
    const Call fBefore;
};

} // namespace pmutil
