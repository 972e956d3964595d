// A channel over a block of memory: its own, which may grow, or one that belongs to someone else.
//
// Position <= data size <= capacity, and the dirty range lies within the data. All sizes and
// positions are in bytes. A failed operation leaves the buffer as it was (Attach tells the one
// exception), and memory that can't be had throws std::bad_alloc. CopyOut, CopyIn, Grow and
// SetCapacity to another size throw std::runtime_error "pmutil::Channel not open" after Close;
// Attach and assignment open the buffer again.
#pragma once

#include <cstdint>

#include "pmutil/RandomAccess.h"

namespace pmutil {

class Buffer : public RandomAccess {
public:
    // An empty buffer with a block of its own, which grows as it is written to.
    explicit Buffer(std::uint64_t capacity);

    // Wraps the caller's block, all of which counts as data; the block must outlive this object.
    // Throws std::runtime_error "Buffer: null buf with positive size".
    Buffer(void* block, std::uint64_t size);

    // A copy owns its block, and grows if the original does. What was put back with Unread stays
    // with the original. The copy of a closed buffer is closed, and so is that of a buffer without
    // capacity.
    Buffer(const Buffer& other);
    Buffer& operator=(const Buffer& other);
    ~Buffer() override;

    // Copies `nbytes` from the position on and moves it. Throws std::runtime_error
    // "Buffer: CopyOut nbytes too large" if the data end before that.
    void CopyOut(void* bytes, std::uint64_t nbytes);

    // Copies `nbytes` to the position and moves it, growing if need be. Throws XUnderrun with a
    // count of 0 if they don't fit a buffer that doesn't grow.
    void CopyIn(const void* bytes, std::uint64_t nbytes);

    // SetState and SetOffset set the position, and with it forget what was put back with Unread.
    // Each setter throws std::runtime_error, SetState std::invalid_argument, if the buffer would
    // contradict itself: "Buffer::SetState: bad args", "Buffer: bad endOfData param",
    // "Buffer: bad offset param", "Buffer: bad dirty bounds".
    void SetState(std::uint64_t offset, std::uint64_t endOfData, std::uint64_t dirtyBegin,
                  std::uint64_t dirtyEnd);
    void SetEndOfData(std::uint64_t end);
    void SetOffset(std::uint64_t offset);

    // What was written since lies between the bounds: a write widens the range and nothing but
    // this operation narrows it. It starts out at 0.
    void SetDirtyBounds(std::uint64_t begin, std::uint64_t end);

    // Drops the present block and wraps another, as the constructor does. A null one is reported as
    // a failed requirement, "Failed requirement: buf != NULL", which throws std::runtime_error; if
    // `size` is not 0 the old block is gone by then, and the buffer empty and closed. What was put
    // back with Unread came out of the old block and is forgotten.
    void Attach(void* block, std::uint64_t size);

    // Makes room for `extra` more bytes, rounded up to whole pages of 4096. Throws
    // std::runtime_error "not IsGrowable" and "cannot Grow Buffer that large".
    void Grow(std::uint64_t extra);

    // Reallocates to exactly `capacity`. Throws std::runtime_error
    // "Buffer: ownership is required for this operation" and
    // "shrinking Buffer would invalidate data".
    void SetCapacity(std::uint64_t capacity);

    // Throws std::runtime_error "Buffer: ownership is required for this operation".
    void RequireOwnership() const;

    std::uint64_t GetOffset() const { return fOffset; }
    std::uint64_t GetEndOfData() const { return fEndOfData; }
    std::uint64_t GetCapacity() const { return fCapacity; }
    std::uint64_t GetDirtyBegin() const { return fDirtyBegin; }
    std::uint64_t GetDirtyEnd() const { return fDirtyEnd; }
    bool IsOwned() const { return (fFlags & kOwned) != 0; }
    bool IsGrowable() const { return (fFlags & kGrowable) != 0; }

    // The block, null once closed; valid until the buffer grows, closes or changes its block.
    const unsigned char* GetData() const { return fData; }

protected:
    void BinioClose() override;
    bool BinioIsOpen() const override;
    std::uint64_t BinioReadSome(void* bytes, std::uint64_t nbytes) override;
    std::uint32_t DoReadByte() override;
    std::uint64_t BinioWriteSome(const void* bytes, std::uint64_t nbytes) override;
    std::uint64_t BinioTell() override;
    void BinioSeek(std::uint64_t position) override;
    void BinioSeekRelative(std::int64_t delta) override;
    void BinioSeekEnd() override;

    // Cuts data and block at the position; at full capacity does nothing at all.
    void BinioSetEOF() override;

private:
    static constexpr std::uint32_t kOwned = 1;
    static constexpr std::uint32_t kGrowable = 2;

    static bool IsConsistent(const void* data, std::uint64_t offset, std::uint64_t endOfData,
                             std::uint64_t capacity, std::uint64_t dirtyBegin,
                             std::uint64_t dirtyEnd);
    // Closing leaves sizes and flags as they are, so that they alone don't tell.
    void RequireNotClosed() const;
    void FreeBlock();
    void Reallocate(std::uint64_t capacity, std::uint64_t nbytesToKeep);
    void Put(const void* bytes, std::uint64_t nbytes);
    void Swap(Buffer& other) noexcept;

    std::uint64_t fOffset = 0;
    std::uint64_t fEndOfData = 0;
    std::uint64_t fCapacity = 0;
    std::uint64_t fDirtyBegin = 0;
    std::uint64_t fDirtyEnd = 0;
    std::uint32_t fFlags = 0;
    bool fClosed = false;
    unsigned char* fData = nullptr;
};

} // namespace pmutil
