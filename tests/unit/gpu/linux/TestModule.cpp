#include "TestModule.h"

#include <dlfcn.h>

namespace assay_test {

void* LoadTestModule()
{
    return dlopen(TEST_MODULE, RTLD_NOW | RTLD_LOCAL);
}

void UnloadTestModule(void* module)
{
    dlclose(module);
}

} // namespace assay_test
