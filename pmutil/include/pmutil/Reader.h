// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A channel that can be read. Bytes can be put back.
#pragma once

#include <cstdint>
#include <memory>

#include "pmutil/Channel.h"

namespace pmutil {

class Buffer;
class Previewer;

class Reader : public virtual Channel {
public:
    // Forwards to `reader`, which may be null; owns it if `own` is true.
    explicit Reader(Reader* reader = nullptr, bool own = false);
    ~Reader() override;

    // Replaces the target, as Channel::SetTarget does.
    void SetReader(Reader* reader, bool own);

    // The operations below throw std::runtime_error "pmutil::Channel not open" on a closed channel,
    // and what the target throws.

    // Reads at most `nbytes` bytes and returns the count, which may be smaller; 0 at the end of the
    // data. If bytes were put back, returns only those. Throws std::runtime_error "direct read
    // while preview active", and std::logic_error "read returned more than asked" if the target
    // returns a larger count.
    std::uint64_t ReadSome(void* bytes, std::uint64_t nbytes);

    // Reads exactly `nbytes` bytes and returns true. If the data end before that, puts the bytes
    // back and returns false. Throws as ReadSome does, but "direct read while preview active" as
    // std::logic_error.
    bool ReadAll(void* bytes, std::uint64_t nbytes);

    // Puts bytes back: the next read returns them. They replace bytes that were put back before and
    // not read since. Bytes that were put back, here, by ReadAll or by a preview, are dropped when
    // the channel is closed, gets another target, or is positioned by a seek; a preview that is
    // active at that time puts nothing back.
    void Unread(const void* bytes, std::uint64_t nbytes);

    // The operations that Previewer uses.

    // Starts a preview; until its end only ReadPreview may read. Throws std::runtime_error
    // "Reader: Previewer already active".
    void BeginPreview(Previewer& previewer);

    // ReadSome for the active preview.
    std::uint64_t ReadPreview(void* bytes, std::uint64_t nbytes);

    // Ends the preview and puts back all of `data`, the bytes it read. Throws std::runtime_error
    // "Buffer: bad offset param" if the buffer's state is invalid, and
    // "Buffer: offset would be negative" if `data` is longer than the bytes that were put back and
    // read since; the preview has ended also then.
    void EndPreview(std::unique_ptr<Buffer> data);

protected:
    virtual std::uint64_t DoReadSome(void* bytes, std::uint64_t nbytes);
    virtual std::uint64_t BinioReadSome(void* bytes, std::uint64_t nbytes);

    // Called after `nbytes` bytes were put back.
    virtual void DoUnread(std::uint64_t nbytes);

    // Returns the next byte, 0 to 255, or 0xFFFFFFFF at the end of the data.
    virtual std::uint32_t DoReadByte();

    void DoClose() override;

    // Drops the bytes that were put back and those that an active preview has read.
    void DropPushback();

private:
    void PutBack(const void* bytes, std::uint64_t nbytes);

    Reader* fReader = nullptr;
    std::unique_ptr<Buffer> fPushback;
    Previewer* fPreviewer = nullptr;
    bool fPreviewIsStale = false;
};

} // namespace pmutil
