// Copies inside a device's memory, timed by the host's clock, for comparison with the report's
// CLBandwidth, which uses the device's counters. One benchmark per GPU, in the report's order and
// with its tags.
#include <cstdint>
#include <cstdlib>
#include <iostream>
#include <string>

#include <benchmark/benchmark.h>

#include "qgf/OCL.h"

namespace {

constexpr std::size_t kBufferBytes = 0x1000000;
// Long enough that the latency of the commands doesn't matter.
constexpr int kCopiesPerBatch = 200;

void Require(cl_int status, const char* call)
{
    if (status != CL_SUCCESS)
        throw QGF::LogicalException(std::string(call) + " failed: " + std::to_string(status));
}

class Buffer {
public:
    Buffer(const QGF::OCL::Context& context, cl_mem_flags flags)
    {
        cl_int status = CL_SUCCESS;
        fBuffer = Table().clCreateBuffer(context.handle(), flags, kBufferBytes, nullptr, &status);
        Require(status, "clCreateBuffer");
    }
    ~Buffer() { QGF::OCL::HandleTraits<cl_mem>::Release(fBuffer); }
    Buffer(const Buffer&) = delete;
    Buffer& operator=(const Buffer&) = delete;

    cl_mem handle() const { return fBuffer; }

    static const QGF::OCL::FunctionTable& Table()
    {
        return QGF::OCL::ExtensionManager::instance().table();
    }

private:
    cl_mem fBuffer = nullptr;
};

void CopyBatch(const QGF::OCL::CommandQueue& queue, const Buffer& source, const Buffer& destination)
{
    for (int i = 0; i < kCopiesPerBatch; ++i)
        Require(Buffer::Table().clEnqueueCopyBuffer(queue.handle(), source.handle(),
                                                    destination.handle(), 0, 0, kBufferBytes, 0,
                                                    nullptr, nullptr),
                "clEnqueueCopyBuffer");
    Require(Buffer::Table().clFinish(queue.handle()), "clFinish");
}

void Copy(benchmark::State& state, const QGF::OCL::Device& device)
{
    const QGF::OCL::ContextProperties properties(device.platform());
    const QGF::OCL::Context context(properties, device, QGF::OCL::ContextCallback{});
    const QGF::OCL::CommandQueue queue(context, device, false, false);
    const Buffer source(context, CL_MEM_READ_ONLY);
    const Buffer destination(context, CL_MEM_WRITE_ONLY);
    CopyBatch(queue, source, destination); // makes the driver allocate the buffers
    for ([[maybe_unused]] auto _ : state)
        CopyBatch(queue, source, destination);
    // Each copy reads and writes.
    state.SetBytesProcessed(state.iterations() * kCopiesPerBatch * 2 * std::int64_t{kBufferBytes});
}

void RegisterGPUs()
{
    int index = 0;
    for (const QGF::OCL::Platform& platform : QGF::OCL::platforms()) {
        for (const QGF::OCL::Device& device : platform.devices(CL_DEVICE_TYPE_GPU)) {
            const std::string name = "clgpu[" + std::to_string(index++) + "]";
            benchmark::RegisterBenchmark(name.c_str(), Copy, device)
                ->UseRealTime()
                ->Unit(benchmark::kMillisecond);
        }
    }
}

} // namespace

int main(int argc, char** argv)
{
    try {
        benchmark::Initialize(&argc, argv);
        RegisterGPUs();
        benchmark::RunSpecifiedBenchmarks();
        benchmark::Shutdown();
        return EXIT_SUCCESS;
    } catch (const std::exception& e) {
        std::cerr << e.what() << std::endl;
        return EXIT_FAILURE;
    }
}
