#include "pmutil/Writer.h"

#include <stdexcept>

namespace pmutil {

Writer::Writer(Writer* writer, bool own) : fWriter(writer)
{
    if (writer != nullptr)
        SetTarget(writer, own);
}

Writer::~Writer() = default;

void Writer::SetWriter(Writer* writer, bool own)
{
    SetTarget(writer, own);
    fWriter = writer;
}

std::uint64_t Writer::WriteSome(const void* bytes, std::uint64_t nbytes)
{
    RequireOpen();
    if (nbytes == 0)
        return 0;
    const std::uint64_t count = DoWriteSome(bytes, nbytes);
    if (count == 0)
        throw std::logic_error("DoWriteSome should never return 0 if nbytes > 0");
    return count;
}

void Writer::WriteAll(const void* bytes, std::uint64_t nbytes)
{
    RequireOpen();
    const auto* rest = static_cast<const unsigned char*>(bytes);
    while (nbytes > 0) {
        const std::uint64_t count = DoWriteSome(rest, nbytes);
        if (count == 0)
            throw std::logic_error("WriteFunc should never return 0");
        rest += count;
        nbytes -= count;
    }
}

void Writer::Flush()
{
    RequireOpen();
    DoFlush();
}

std::uint64_t Writer::DoWriteSome(const void* bytes, std::uint64_t nbytes)
{
    return BinioWriteSome(bytes, nbytes);
}

void Writer::DoFlush() {}

std::uint64_t Writer::BinioWriteSome(const void* bytes, std::uint64_t nbytes)
{
    RequireTarget(fWriter);
    return fWriter->WriteSome(bytes, nbytes);
}

} // namespace pmutil
