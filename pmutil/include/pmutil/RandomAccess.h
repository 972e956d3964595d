// A channel that reads, writes and seeks, and whose end can be set: a file, or memory.
#pragma once

#include "pmutil/Reader.h"
#include "pmutil/Seeker.h"
#include "pmutil/Writer.h"

namespace pmutil {

class RandomAccess : public Reader, public Writer, public Seeker {
public:
    // Forwards all capabilities to `target`, which may be null, and owns it with `own` set.
    explicit RandomAccess(RandomAccess* target = nullptr, bool own = false);
    ~RandomAccess() override;

    // As Channel::SetTarget, for all capabilities at once.
    void SetRandomAccess(RandomAccess* target, bool own);

    // Ends the data at the current position. Throws std::runtime_error "pmutil::Channel not open"
    // on a closed channel, and what the channel below throws.
    void SetEOF();

protected:
    // What was read before and put back isn't what stands at the new position.
    void DoSeek(std::uint64_t position) override;
    void DoSeekRelative(std::int64_t delta) override;
    void DoSeekEnd() override;
    virtual void DoSetEOF();
    virtual void BinioSetEOF();
};

} // namespace pmutil
