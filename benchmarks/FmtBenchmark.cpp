// Formatting an int and a short text with Fmt, compared with snprintf into a string and with {fmt}.
#include <cstdio>
#include <string>

#include <benchmark/benchmark.h>
#define FMT_HEADER_ONLY
#include <fmt/format.h>

#include "pmutil/Fmt.h"

namespace {

constexpr int kInt = 1234567;
constexpr char kText[] = "Graphics adapter of the second bus";

// `print(buffer, size, value)` is snprintf with a literal format.
template <typename T, typename Print>
void Snprintf(benchmark::State& state, Print print, T value)
{
    std::string out;
    for (auto _ : state) {
        char buffer[256];
        benchmark::DoNotOptimize(value);
        const int length = print(buffer, sizeof buffer, value);
        out.assign(buffer, static_cast<std::size_t>(length));
        benchmark::DoNotOptimize(out);
    }
}

void SnprintfInt(benchmark::State& state)
{
    Snprintf(
        state,
        [](char* buffer, std::size_t size, int value) {
            return std::snprintf(buffer, size, "%d", value);
        },
        kInt);
}
BENCHMARK(SnprintfInt);

void SnprintfText(benchmark::State& state)
{
    Snprintf(
        state,
        [](char* buffer, std::size_t size, const char* value) {
            return std::snprintf(buffer, size, "\"%s\"", value);
        },
        static_cast<const char*>(kText));
}
BENCHMARK(SnprintfText);

void FmtlibInt(benchmark::State& state)
{
    for (auto _ : state) {
        int value = kInt;
        benchmark::DoNotOptimize(value);
        benchmark::DoNotOptimize(fmt::format("{}", value));
    }
}
BENCHMARK(FmtlibInt);

void FmtlibText(benchmark::State& state)
{
    for (auto _ : state) {
        const char* value = kText;
        benchmark::DoNotOptimize(value);
        benchmark::DoNotOptimize(fmt::format("\"{}\"", value));
    }
}
BENCHMARK(FmtlibText);

template <typename T>
void Format(benchmark::State& state, T value)
{
    std::string out;
    for (auto _ : state) {
        benchmark::DoNotOptimize(value);
        pmutil::Fmt::ToText(out, value);
        benchmark::DoNotOptimize(out);
    }
}

void FormatInt(benchmark::State& state)
{
    Format(state, kInt);
}
BENCHMARK(FormatInt);

void FormatText(benchmark::State& state)
{
    Format(state, static_cast<const char*>(kText));
}
BENCHMARK(FormatText);

} // namespace

BENCHMARK_MAIN();
