// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A channel over a block of memory: an owned block, which may grow, or the caller's block.
//
// Invariants: position <= data size <= capacity; the dirty range is within the data. All sizes and
// positions are in bytes. A failed operation leaves the buffer unchanged, except Attach. If memory
// can't be allocated, std::bad_alloc is thrown. After Close, the operations CopyOut, CopyIn, Grow
// and SetCapacity to another size throw std::runtime_error "pmutil::Channel not open"; Attach and
// assignment open the buffer again.
#pragma once

#include <cstdint>

#include "pmutil/RandomAccess.h"

namespace pmutil {

class Buffer : public RandomAccess {
public:
    // Makes an empty, growable buffer with an owned block.
    explicit Buffer(std::uint64_t capacity);

    // Wraps the caller's block; all of it counts as data. The block must outlive this object.
    // Throws std::runtime_error "Buffer: null buf with positive size".
    Buffer(void* block, std::uint64_t size);

    // A copy owns its block and is growable if the original is. Bytes of Unread aren't copied. The
    // copy of a closed buffer or of a buffer without capacity is closed.
    Buffer(const Buffer& other);
    Buffer& operator=(const Buffer& other);
    ~Buffer() override;

    // Copies `nbytes` bytes at the position to `bytes` and advances the position. Throws
    // std::runtime_error "Buffer: CopyOut nbytes too large" if fewer bytes of data are left.
    void CopyOut(void* bytes, std::uint64_t nbytes);

    // Copies `nbytes` bytes to the position and advances it; a growable buffer grows if necessary.
    // Throws XUnderrun with count 0 if the bytes don't fit and the buffer isn't growable.
    void CopyIn(const void* bytes, std::uint64_t nbytes);

    // SetState and SetOffset set the position and drop the bytes of Unread. If a setter would break
    // an invariant, it throws std::runtime_error, SetState std::invalid_argument:
    // "Buffer::SetState: bad args", "Buffer: bad endOfData param", "Buffer: bad offset param",
    // "Buffer: bad dirty bounds".
    void SetState(std::uint64_t offset, std::uint64_t endOfData, std::uint64_t dirtyBegin,
                  std::uint64_t dirtyEnd);
    void SetEndOfData(std::uint64_t end);
    void SetOffset(std::uint64_t offset);

    // Sets the range of bytes written since then. It is 0 to 0 at first; a write widens it, and
    // only this operation narrows it.
    void SetDirtyBounds(std::uint64_t begin, std::uint64_t end);

    // Releases the present block and wraps another, like the constructor. Drops the bytes of
    // Unread. For a null block, reports "Failed requirement: buf != NULL", which throws
    // std::runtime_error; if `size` isn't 0, the old block has been released and the buffer is
    // empty and closed.
    void Attach(void* block, std::uint64_t size);

    // Enlarges the capacity by `extra` bytes and rounds it up to a multiple of 4096. Throws
    // std::runtime_error "not IsGrowable" and "cannot Grow Buffer that large".
    void Grow(std::uint64_t extra);

    // Reallocates the block to `capacity` bytes. Throws std::runtime_error
    // "Buffer: ownership is required for this operation" and
    // "shrinking Buffer would invalidate data".
    void SetCapacity(std::uint64_t capacity);

    // Throws std::runtime_error "Buffer: ownership is required for this operation" if the block
    // isn't owned.
    void RequireOwnership() const;

    std::uint64_t GetOffset() const { return fOffset; }
    std::uint64_t GetEndOfData() const { return fEndOfData; }
    std::uint64_t GetCapacity() const { return fCapacity; }
    std::uint64_t GetDirtyBegin() const { return fDirtyBegin; }
    std::uint64_t GetDirtyEnd() const { return fDirtyEnd; }
    bool IsOwned() const { return (fFlags & kOwned) != 0; }
    bool IsGrowable() const { return (fFlags & kGrowable) != 0; }

    // Returns the block, null after Close. Valid until the buffer grows, closes or changes its
    // block.
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

    // Truncates data and block at the position. Does nothing if the position is at the capacity.
    void BinioSetEOF() override;

private:
    static constexpr std::uint32_t kOwned = 1;
    static constexpr std::uint32_t kGrowable = 2;

    static bool IsConsistent(const void* data, std::uint64_t offset, std::uint64_t endOfData,
                             std::uint64_t capacity, std::uint64_t dirtyBegin,
                             std::uint64_t dirtyEnd);
    // Close leaves sizes and flags unchanged, so a closed buffer needs a flag of its own.
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
