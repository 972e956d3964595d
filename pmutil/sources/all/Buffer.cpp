#include "pmutil/Buffer.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <memory>
#include <new>
#include <stdexcept>
#include <utility>

#include "pmutil/Requirement.h"
#include "pmutil/XUnderrun.h"

namespace pmutil {

namespace {

constexpr std::uint64_t kPage = 0x1000; // bytes
constexpr std::uint64_t kMaxCapacity = std::numeric_limits<std::uint64_t>::max();
constexpr std::uint32_t kNoByte = 0xFFFFFFFF;

constexpr char kBadState[] = "Buffer::SetState: bad args";
constexpr char kBadOffset[] = "Buffer: bad offset param";

unsigned char* Allocate(std::uint64_t size)
{
    if (size > static_cast<std::uint64_t>(std::numeric_limits<std::ptrdiff_t>::max()))
        throw std::bad_alloc();
    return new unsigned char[static_cast<std::size_t>(size)];
}

// Calls memcpy, which must not get null pointers even for 0 bytes.
void Copy(void* to, const void* from, std::uint64_t nbytes)
{
    if (nbytes > 0)
        std::memcpy(to, from, static_cast<std::size_t>(nbytes));
}

} // namespace

Buffer::Buffer(std::uint64_t capacity)
    : fCapacity(capacity), fFlags(kOwned | kGrowable), fData(Allocate(capacity))
{}

Buffer::Buffer(void* block, std::uint64_t size)
    : fEndOfData(size), fCapacity(size), fData(static_cast<unsigned char*>(block))
{
    if (block == nullptr && size > 0)
        throw std::runtime_error("Buffer: null buf with positive size");
}

Buffer::Buffer(const Buffer& other)
    // NOLINTBEGIN(readability-redundant-member-init): GCC requires the bases in a copy constructor.
    : Channel(),
      RandomAccess(),
      // NOLINTEND(readability-redundant-member-init)
      fOffset(other.fOffset),
      fEndOfData(other.fEndOfData),
      fCapacity(other.fCapacity),
      fDirtyBegin(other.fDirtyBegin),
      fDirtyEnd(other.fDirtyEnd),
      fFlags((other.fFlags & kGrowable) | kOwned),
      fClosed(other.fClosed)
{
    if (fCapacity != 0 && !fClosed) {
        fData = Allocate(fCapacity);
        Copy(fData, other.fData, fEndOfData);
    }
}

Buffer& Buffer::operator=(const Buffer& other)
{
    if (this != &other) {
        Buffer copy(other);
        Swap(copy);
        DropPushback();
    }
    return *this;
}

Buffer::~Buffer()
{
    FreeBlock();
}

void Buffer::Swap(Buffer& other) noexcept
{
    std::swap(fOffset, other.fOffset);
    std::swap(fEndOfData, other.fEndOfData);
    std::swap(fCapacity, other.fCapacity);
    std::swap(fDirtyBegin, other.fDirtyBegin);
    std::swap(fDirtyEnd, other.fDirtyEnd);
    std::swap(fFlags, other.fFlags);
    std::swap(fClosed, other.fClosed);
    std::swap(fData, other.fData);
}

bool Buffer::IsConsistent(const void* data, std::uint64_t offset, std::uint64_t endOfData,
                          std::uint64_t capacity, std::uint64_t dirtyBegin, std::uint64_t dirtyEnd)
{
    return offset <= endOfData && endOfData <= capacity && dirtyBegin <= dirtyEnd &&
           dirtyEnd <= endOfData && (data != nullptr || capacity == 0);
}

void Buffer::RequireNotClosed() const
{
    if (fClosed)
        throw std::runtime_error("pmutil::Channel not open");
}

void Buffer::FreeBlock()
{
    if (IsOwned())
        delete[] fData;
    fData = nullptr;
}

void Buffer::Reallocate(std::uint64_t capacity, std::uint64_t nbytesToKeep)
{
    std::unique_ptr<unsigned char[]> block(Allocate(capacity));
    Copy(block.get(), fData, nbytesToKeep);
    FreeBlock();
    fData = block.release();
    fCapacity = capacity;
}

void Buffer::Put(const void* bytes, std::uint64_t nbytes)
{
    Copy(fData + fOffset, bytes, nbytes);
    fDirtyBegin = std::min(fDirtyBegin, fOffset);
    fOffset += nbytes;
    fDirtyEnd = std::max(fDirtyEnd, fOffset);
    fEndOfData = std::max(fEndOfData, fOffset);
}

void Buffer::CopyOut(void* bytes, std::uint64_t nbytes)
{
    if (nbytes > fEndOfData - fOffset)
        throw std::runtime_error("Buffer: CopyOut nbytes too large");
    RequireNotClosed();
    Copy(bytes, fData + fOffset, nbytes);
    fOffset += nbytes;
}

void Buffer::CopyIn(const void* bytes, std::uint64_t nbytes)
{
    const std::uint64_t room = fCapacity - fOffset;
    if (nbytes > room) {
        if (!IsGrowable())
            throw XUnderrun(0);
        Grow(nbytes - room);
    }
    RequireNotClosed();
    if (nbytes > 0)
        Put(bytes, nbytes);
}

void Buffer::SetState(std::uint64_t offset, std::uint64_t endOfData, std::uint64_t dirtyBegin,
                      std::uint64_t dirtyEnd)
{
    if (!IsConsistent(fData, offset, endOfData, fCapacity, dirtyBegin, dirtyEnd))
        throw std::invalid_argument(kBadState);
    fOffset = offset;
    fEndOfData = endOfData;
    fDirtyBegin = dirtyBegin;
    fDirtyEnd = dirtyEnd;
    DropPushback();
}

void Buffer::SetEndOfData(std::uint64_t end)
{
    if (!IsConsistent(fData, fOffset, end, fCapacity, fDirtyBegin, fDirtyEnd))
        throw std::runtime_error("Buffer: bad endOfData param");
    fEndOfData = end;
}

void Buffer::SetOffset(std::uint64_t offset)
{
    if (!IsConsistent(fData, offset, fEndOfData, fCapacity, fDirtyBegin, fDirtyEnd))
        throw std::runtime_error(kBadOffset);
    fOffset = offset;
    DropPushback();
}

void Buffer::SetDirtyBounds(std::uint64_t begin, std::uint64_t end)
{
    if (!IsConsistent(fData, fOffset, fEndOfData, fCapacity, begin, end))
        throw std::runtime_error("Buffer: bad dirty bounds");
    fDirtyBegin = begin;
    fDirtyEnd = end;
}

void Buffer::Attach(void* block, std::uint64_t size)
{
    const auto requireBlock = [block] {
        if (block == nullptr)
            RequirementFailed(__FILE__, __LINE__, "Failed requirement: buf != NULL", true);
    };
    if (size == 0)
        requireBlock();
    DropPushback();
    FreeBlock();
    fClosed = false;
    fOffset = fEndOfData = fCapacity = fDirtyBegin = fDirtyEnd = 0;
    fFlags = 0;
    requireBlock();
    if (block == nullptr && size > 0)
        throw std::invalid_argument(kBadState);
    fData = static_cast<unsigned char*>(block);
    fEndOfData = size;
    fCapacity = size;
}

void Buffer::Grow(std::uint64_t extra)
{
    if (!IsGrowable())
        throw std::runtime_error("not IsGrowable");
    if (extra > kMaxCapacity - fCapacity)
        throw std::runtime_error("cannot Grow Buffer that large");
    RequireNotClosed();
    std::uint64_t wanted = fCapacity + extra;
    if (wanted <= kMaxCapacity - (kPage - 1))
        wanted = (wanted + (kPage - 1)) / kPage * kPage;
    Reallocate(wanted, fEndOfData);
}

void Buffer::SetCapacity(std::uint64_t capacity)
{
    if (capacity == fCapacity)
        return;
    RequireOwnership();
    if (capacity < fEndOfData)
        throw std::runtime_error("shrinking Buffer would invalidate data");
    RequireNotClosed();
    Reallocate(capacity, fEndOfData);
}

void Buffer::RequireOwnership() const
{
    if (!IsOwned())
        throw std::runtime_error("Buffer: ownership is required for this operation");
}

void Buffer::BinioClose()
{
    FreeBlock();
    fClosed = true;
}

bool Buffer::BinioIsOpen() const
{
    return fData != nullptr;
}

std::uint64_t Buffer::BinioReadSome(void* bytes, std::uint64_t nbytes)
{
    const std::uint64_t count = std::min(nbytes, fEndOfData - fOffset);
    Copy(bytes, fData + fOffset, count);
    fOffset += count;
    return count;
}

std::uint32_t Buffer::DoReadByte()
{
    return fOffset < fEndOfData ? fData[fOffset++] : kNoByte;
}

std::uint64_t Buffer::BinioWriteSome(const void* bytes, std::uint64_t nbytes)
{
    std::uint64_t room = std::min(nbytes, fCapacity - fOffset);
    if (room == 0) {
        if (!IsGrowable())
            throw std::runtime_error("Buffer full");
        Grow(nbytes);
        room = std::min(nbytes, fCapacity - fOffset);
        if (room == 0)
            return 0;
    }
    Put(bytes, room);
    return room;
}

std::uint64_t Buffer::BinioTell()
{
    return fOffset;
}

void Buffer::BinioSeek(std::uint64_t position)
{
    SetOffset(position);
}

void Buffer::BinioSeekRelative(std::int64_t delta)
{
    // Negate as unsigned, since the negation of the lowest signed number overflows.
    const auto magnitude =
        delta < 0 ? 0 - static_cast<std::uint64_t>(delta) : static_cast<std::uint64_t>(delta);
    if (delta < 0 && magnitude > fOffset)
        throw std::runtime_error("Buffer: offset would be negative");
    if (delta > 0 && magnitude > kMaxCapacity - fOffset)
        throw std::runtime_error("Buffer: seek past EOF");
    Seek(delta < 0 ? fOffset - magnitude : fOffset + magnitude);
}

void Buffer::BinioSeekEnd()
{
    fOffset = fEndOfData;
}

void Buffer::BinioSetEOF()
{
    if (fOffset == fCapacity)
        return;
    RequireOwnership();
    const std::uint64_t dirtyBegin = std::min(fDirtyBegin, fOffset);
    const std::uint64_t dirtyEnd = std::min(fDirtyEnd, fOffset);
    if (!IsConsistent(fData, fOffset, fOffset, fCapacity, dirtyBegin, dirtyEnd))
        throw std::invalid_argument(kBadState);
    Reallocate(fOffset, fOffset);
    fDirtyBegin = dirtyBegin;
    fDirtyEnd = dirtyEnd;
    fEndOfData = fOffset;
}

} // namespace pmutil
