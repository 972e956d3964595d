#include "pmutil/Previewer.h"

#include <algorithm>
#include <stdexcept>

#include "pmutil/Buffer.h"

namespace pmutil {

namespace {

// Bytes. The memory for the bytes of a read is allocated before the read, so that no byte is lost
// if the allocation fails.
constexpr std::uint64_t kMaxReadSize = 0x10000;

} // namespace

Previewer::Previewer(Reader& reader) : fReader(reader), fCollected(std::make_unique<Buffer>(0))
{
    reader.BeginPreview(*this);
}

Previewer::~Previewer()
{
    try {
        End();
    } catch (...) {
    }
}

std::uint64_t Previewer::ReadSome(void* bytes, std::uint64_t nbytes)
{
    if (fCollected == nullptr)
        throw std::runtime_error("Previewer: preview ended");
    const std::uint64_t wanted = std::min(nbytes, kMaxReadSize);
    const std::uint64_t capacity = fCollected->GetCapacity();
    if (capacity - fCollected->GetOffset() < wanted)
        fCollected->Grow(std::max(wanted, capacity));
    const std::uint64_t count = fReader.ReadPreview(bytes, wanted);
    fCollected->CopyIn(bytes, count);
    return count;
}

void Previewer::End()
{
    if (fCollected != nullptr)
        fReader.EndPreview(std::move(fCollected));
}

} // namespace pmutil
