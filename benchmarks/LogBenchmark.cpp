// The cost of a log statement: disabled, and writing a line.
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <string>

#include <benchmark/benchmark.h>

#include "pmutil/LogSinks.h"
#include "pmutil/PMLogging.h"

namespace {

pmutil::DebugValue gOff{"LogBenchmark.off", 0};
pmutil::DebugValue gOn{"LogBenchmark.on", 1};
std::atomic<std::int32_t> gPlainFlag{0};

#ifdef _WIN32
constexpr char kNullDevice[] = "NUL";
#else
constexpr char kNullDevice[] = "/dev/null";
#endif

std::FILE* OpenNullDevice()
{
    std::FILE* const file = std::fopen(kNullDevice, "w");
    if (file == nullptr)
        std::abort();
    return file;
}

// What the report's logger writes, on a stream that goes nowhere.
class NullDeviceLogger : public pmutil::PMStdioLogger {
public:
    using PMStdioLogger::PMStdioLogger;
    std::string GetPrefix(const char* file, int line) override
    {
        return "# " + PMStdioLogger::GetPrefix(file, line);
    }
};

void LoadAndTest(benchmark::State& state)
{
    int count = 0;
    for (auto _ : state) {
        if (gPlainFlag.load(std::memory_order_relaxed) != 0)
            benchmark::DoNotOptimize(++count);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(LoadAndTest);

void OffStatement(benchmark::State& state)
{
    pmutil::InitLogging();
    benchmark::DoNotOptimize(&pmutil::GetDebugValue(gOff));
    int count = 0;
    for (auto _ : state) {
        PM_LOG(gOff, "count=" << ++count);
        benchmark::ClobberMemory();
    }
}
BENCHMARK(OffStatement);

// As long as the line that Statement writes.
const std::string& SampleLine()
{
    static const std::string line =
        "# 00000.2026.01.01_00:00:00.000(+00.000)[tid=12345] count=1234567\n";
    return line;
}

void BareLine(benchmark::State& state)
{
    std::FILE* const file = OpenNullDevice();
    for (auto _ : state) {
        std::fwrite(SampleLine().data(), 1, SampleLine().size(), file);
        std::fflush(file);
    }
    std::fclose(file);
}
BENCHMARK(BareLine);

// The logger without the assembly of the message.
void LoggerLine(benchmark::State& state)
{
    pmutil::InitLogging();
    std::FILE* const file = OpenNullDevice();
    {
        NullDeviceLogger logger(file);
        for (auto _ : state)
            logger.LogPrintf(__FILE__, __LINE__, "%s", "count=1234567");
    }
    std::fclose(file);
}
BENCHMARK(LoggerLine);

// The whole statement with the assembly of the message.
void Statement(benchmark::State& state)
{
    pmutil::InitLogging();
    std::FILE* const file = OpenNullDevice();
    {
        const NullDeviceLogger logger(file);
        for (auto _ : state)
            PM_LOG(gOn, "count=" << 1234567);
    }
    std::fclose(file);
}
BENCHMARK(Statement);

} // namespace

BENCHMARK_MAIN();
