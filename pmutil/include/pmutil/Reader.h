// A channel that gives bytes, and takes some of them back.
#pragma once

#include <cstdint>
#include <memory>

#include "pmutil/Channel.h"

namespace pmutil {

class Buffer;
class Previewer;

class Reader : public virtual Channel {
public:
    // Forwards to `reader`, which may be null, and owns it with `own` set.
    explicit Reader(Reader* reader = nullptr, bool own = false);
    ~Reader() override;

    // As Channel::SetTarget, for the whole object.
    void SetReader(Reader* reader, bool own);

    // Each throws std::runtime_error "pmutil::Channel not open" on a closed channel, and what the
    // channel below throws.

    // Reads at most `nbytes`, perhaps fewer, and returns how many; 0 at the end of the data. Bytes
    // that were put back come first and alone, in a call of their own. Throws std::runtime_error
    // "direct read while preview active", and std::logic_error "read returned more than asked" if
    // the channel below oversteps.
    std::uint64_t ReadSome(void* bytes, std::uint64_t nbytes);

    // Reads exactly `nbytes` and returns true. If the data end before that, returns false, and what
    // came is put back for the next read. Throws as ReadSome does, but "direct read while preview
    // active" as a std::logic_error.
    bool ReadAll(void* bytes, std::uint64_t nbytes);

    // Puts bytes back: the next read delivers them. They take the place of what was put back
    // earlier and not yet read again. What was put back, here or by ReadAll or a preview, is
    // forgotten when the channel is closed, forwards to another reader, or moves its position
    // otherwise than by reading and writing; a preview across that puts nothing back.
    void Unread(const void* bytes, std::uint64_t nbytes);

    // The Reader's side of a preview; see Previewer for the use of it.

    // While a preview is active only ReadPreview reads. Throws std::runtime_error
    // "Reader: Previewer already active".
    void BeginPreview(Previewer& previewer);

    // ReadSome for the active preview.
    std::uint64_t ReadPreview(void* bytes, std::uint64_t nbytes);

    // Ends the preview and puts back what it read, `data` in full. Throws std::runtime_error
    // "Buffer: bad offset param" if the buffer's state is not valid, and
    // "Buffer: offset would be negative" if the bytes can't have come out of what was put back
    // before; the preview is over all the same.
    void EndPreview(std::unique_ptr<Buffer> data);

protected:
    virtual std::uint64_t DoReadSome(void* bytes, std::uint64_t nbytes);
    virtual std::uint64_t BinioReadSome(void* bytes, std::uint64_t nbytes);

    // Told that `nbytes` bytes were put back.
    virtual void DoUnread(std::uint64_t nbytes);

    // The next byte, 0 to 255, or 0xFFFFFFFF at the end of the data.
    virtual std::uint32_t DoReadByte();

    void DoClose() override;

    // Forgets what was put back, and what an active preview has read.
    void DropPushback();

private:
    void PutBack(const void* bytes, std::uint64_t nbytes);

    Reader* fReader = nullptr;
    std::unique_ptr<Buffer> fPushback;
    Previewer* fPreviewer = nullptr;
    bool fPreviewIsStale = false;
};

} // namespace pmutil
