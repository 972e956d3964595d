// Buffer compared with memcpy, and ReadAll from a pipe compared with a plain loop of reads.
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include <fcntl.h>
#include <unistd.h>

#include <benchmark/benchmark.h>

#include "pmutil/Buffer.h"
#include "pmutil/PosixHandle.h"

namespace {

constexpr std::size_t kBlock = 64 * 1024;
constexpr std::size_t kBlocks = 64;
constexpr std::int64_t kPipeBytes = 64 << 20;

// The memory of both sides of a comparison: 64 blocks of 64 KiB, and one block to copy to or from.
class Blocks {
public:
    unsigned char* At(std::size_t block) { return fAll.data() + block * kBlock; }
    unsigned char* One() { return fOne.data(); }
    std::size_t Size() const { return fAll.size(); }

private:
    std::vector<unsigned char> fAll = std::vector<unsigned char>(kBlock * kBlocks, 'x');
    std::vector<unsigned char> fOne = std::vector<unsigned char>(kBlock, 'y');
};

void MemcpyOut(benchmark::State& state)
{
    Blocks blocks;
    for (auto _ : state) {
        for (std::size_t block = 0; block < kBlocks; ++block) {
            std::memcpy(blocks.One(), blocks.At(block), kBlock);
            benchmark::ClobberMemory();
        }
    }
}
BENCHMARK(MemcpyOut);

void BufferRead(benchmark::State& state)
{
    Blocks blocks;
    pmutil::Buffer buffer(blocks.At(0), blocks.Size());
    for (auto _ : state) {
        buffer.Seek(0);
        for (std::size_t block = 0; block < kBlocks; ++block) {
            buffer.ReadAll(blocks.One(), kBlock);
            benchmark::ClobberMemory();
        }
    }
}
BENCHMARK(BufferRead);

void MemcpyIn(benchmark::State& state)
{
    Blocks blocks;
    for (auto _ : state) {
        for (std::size_t block = 0; block < kBlocks; ++block) {
            std::memcpy(blocks.At(block), blocks.One(), kBlock);
            benchmark::ClobberMemory();
        }
    }
}
BENCHMARK(MemcpyIn);

void BufferWrite(benchmark::State& state)
{
    Blocks blocks;
    pmutil::Buffer buffer(blocks.At(0), blocks.Size());
    for (auto _ : state) {
        buffer.Seek(0);
        for (std::size_t block = 0; block < kBlocks; ++block) {
            buffer.WriteAll(blocks.One(), kBlock);
            benchmark::ClobberMemory();
        }
    }
}
BENCHMARK(BufferWrite);

// Fills a pipe from a thread; `read` reads it to the end with the given block.
template <typename Read>
void Pump(benchmark::State& state, Read read)
{
    std::vector<unsigned char> block(kBlock);
    for (auto _ : state) {
        int ends[2];
        if (::pipe2(ends, O_CLOEXEC) != 0) {
            state.SkipWithError("pipe2 failed");
            return;
        }
        std::thread writer([end = ends[1]] {
            const std::vector<unsigned char> data(kBlock, 'x');
            for (std::int64_t written = 0; written < kPipeBytes;) {
                const ssize_t count = ::write(end, data.data(), data.size());
                if (count <= 0)
                    break;
                written += count;
            }
            ::close(end);
        });
        read(ends[0], block);
        writer.join();
        ::close(ends[0]);
    }
    state.SetBytesProcessed(state.iterations() * kPipeBytes);
}

void PipeBareReads(benchmark::State& state)
{
    Pump(state, [](int end, std::vector<unsigned char>& block) {
        for (;;) {
            std::size_t done = 0;
            while (done < block.size()) {
                const ssize_t count = ::read(end, block.data() + done, block.size() - done);
                if (count <= 0)
                    return;
                done += static_cast<std::size_t>(count);
            }
        }
    });
}
BENCHMARK(PipeBareReads)->UseRealTime();

void PipeReadAll(benchmark::State& state)
{
    Pump(state, [](int end, std::vector<unsigned char>& block) {
        pmutil::PosixHandle reader(end, false);
        while (reader.ReadAll(block.data(), block.size())) {
        }
    });
}
BENCHMARK(PipeReadAll)->UseRealTime();

} // namespace

BENCHMARK_MAIN();
