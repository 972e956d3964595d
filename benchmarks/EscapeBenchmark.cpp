// Escaping and unescaping 1 MiB of text, against a plain copy that looks each byte up in a table.
#include <array>
#include <string>

#include <benchmark/benchmark.h>

#include "pmutil/Escape.h"

namespace {

constexpr std::int64_t kSize = 1 << 20;

// Mostly plain text, like adapter names, with characters to escape in every line.
std::string MakeText()
{
    const std::string line = "Graphics adapter \"7\"\tof the second bus, revision a1\xC3\xA9\n";
    std::string text;
    while (static_cast<std::int64_t>(text.size()) < kSize)
        text += line;
    text.resize(kSize);
    return text;
}

void TableCopy(benchmark::State& state)
{
    std::array<char, 256> table{};
    for (std::size_t code = 0; code < table.size(); ++code)
        table[code] = static_cast<char>(code);
    benchmark::DoNotOptimize(table);
    const std::string text = MakeText();
    for (auto _ : state) {
        std::string out;
        out.reserve(text.size());
        for (const char character : text)
            out += table[static_cast<unsigned char>(character)];
        benchmark::DoNotOptimize(out);
    }
    state.SetBytesProcessed(state.iterations() * kSize);
}
BENCHMARK(TableCopy);

void Escape(benchmark::State& state)
{
    const std::string text = MakeText();
    for (auto _ : state)
        benchmark::DoNotOptimize(pmutil::EscapeText(text, '"'));
    state.SetBytesProcessed(state.iterations() * kSize);
}
BENCHMARK(Escape);

void EscapeCharacters(benchmark::State& state)
{
    const std::string text = MakeText();
    for (auto _ : state) {
        std::string out;
        out.reserve(text.size());
        for (const char character : text)
            pmutil::EscapeCharacter(out, static_cast<unsigned char>(character), '"', 1);
        benchmark::DoNotOptimize(out);
    }
    state.SetBytesProcessed(state.iterations() * kSize);
}
BENCHMARK(EscapeCharacters);

void Unescape(benchmark::State& state)
{
    const std::string text = pmutil::EscapeText(MakeText(), '"');
    for (auto _ : state)
        benchmark::DoNotOptimize(pmutil::UnescapeQuoted(text));
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(text.size()));
}
BENCHMARK(Unescape);

} // namespace

BENCHMARK_MAIN();
