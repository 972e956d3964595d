// Collecting the identity of this machine, compared with plain calls of stat for the same files.
// Goal: at most 5 ms longer.
#include <benchmark/benchmark.h>
#include <sys/stat.h>

#include "identity/Identity.h"

namespace {

const char kProgram[] = "/proc/self/exe";

void CollectIdentity(benchmark::State& state)
{
    std::size_t files = 0;
    for (auto _ : state)
        files = assay_host::GetIdentity(kProgram).fFiles.size();
    state.counters["files"] = static_cast<double>(files);
}
BENCHMARK(CollectIdentity);

void StatTheirFiles(benchmark::State& state)
{
    const assay_host::Identity identity = assay_host::GetIdentity(kProgram);
    for (auto _ : state) {
        for (const assay_host::DriverFile& file : identity.fFiles) {
            struct stat status {};
            benchmark::DoNotOptimize(stat(file.fPath.c_str(), &status));
        }
    }
}
BENCHMARK(StatTheirFiles);

} // namespace

BENCHMARK_MAIN();
