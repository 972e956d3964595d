#include "TestModule.h"

#include <windows.h>

namespace assay_test {

void* LoadTestModule()
{
    return LoadLibraryA(TEST_MODULE);
}

void UnloadTestModule(void* module)
{
    FreeLibrary(static_cast<HMODULE>(module));
}

} // namespace assay_test
