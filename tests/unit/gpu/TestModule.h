// Loads and unloads a library that nothing else loads.
#pragma once

namespace assay_test {

// Returns a handle for UnloadTestModule, null on failure.
void* LoadTestModule();
void UnloadTestModule(void* module);

} // namespace assay_test
