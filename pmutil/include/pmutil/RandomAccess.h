// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A channel that can be read, written, positioned and truncated: a file or memory.
#pragma once

#include "pmutil/Reader.h"
#include "pmutil/Seeker.h"
#include "pmutil/Writer.h"

namespace pmutil {

class RandomAccess : public Reader, public Writer, public Seeker {
public:
    // Forwards to `target`, which may be null; owns it if `own` is true.
    explicit RandomAccess(RandomAccess* target = nullptr, bool own = false);
    ~RandomAccess() override;

    // Replaces the target of all capabilities, as Channel::SetTarget does.
    void SetRandomAccess(RandomAccess* target, bool own);

    // Sets the end of the data to the current position. Throws std::runtime_error
    // "pmutil::Channel not open" on a closed channel, and what the target throws.
    void SetEOF();

protected:
    // A seek drops the bytes of Unread, which belong to the old position.
    void DoSeek(std::uint64_t position) override;
    void DoSeekRelative(std::int64_t delta) override;
    void DoSeekEnd() override;
    virtual void DoSetEOF();
    virtual void BinioSetEOF();
};

} // namespace pmutil
