// A channel that takes bytes.
#pragma once

#include <cstdint>

#include "pmutil/Channel.h"

namespace pmutil {

class Writer : public virtual Channel {
public:
    // Forwards to `writer`, which may be null, and owns it with `own` set.
    explicit Writer(Writer* writer = nullptr, bool own = false);
    ~Writer() override;

    // As Channel::SetTarget, for the whole object.
    void SetWriter(Writer* writer, bool own);

    // Each throws std::runtime_error "pmutil::Channel not open" on a closed channel, and what the
    // channel below throws.

    // Writes at least one byte and at most `nbytes`, and returns how many; 0 only for 0. Throws
    // std::logic_error "DoWriteSome should never return 0 if nbytes > 0" if the channel below takes
    // nothing.
    std::uint64_t WriteSome(const void* bytes, std::uint64_t nbytes);

    // Writes all bytes; after a failure those written so far stay written. Throws std::logic_error
    // "WriteFunc should never return 0" if the channel below takes nothing.
    void WriteAll(const void* bytes, std::uint64_t nbytes);

    void Flush();

protected:
    virtual std::uint64_t DoWriteSome(const void* bytes, std::uint64_t nbytes);
    virtual void DoFlush();
    virtual std::uint64_t BinioWriteSome(const void* bytes, std::uint64_t nbytes);

private:
    Writer* fWriter = nullptr;
};

} // namespace pmutil
