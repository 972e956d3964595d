// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A channel with a position. Positions are in bytes from the start.
#pragma once

#include <cstdint>

#include "pmutil/Channel.h"

namespace pmutil {

class Seeker : public virtual Channel {
public:
    // Forwards to `seeker`, which may be null; owns it if `own` is true.
    explicit Seeker(Seeker* seeker = nullptr, bool own = false);
    ~Seeker() override;

    // Replaces the target, as Channel::SetTarget does.
    void SetSeeker(Seeker* seeker, bool own);

    // The operations below throw std::runtime_error "pmutil::Channel not open" on a closed channel,
    // and what the target throws for an invalid position.
    std::uint64_t Tell();
    void Seek(std::uint64_t position);
    void SeekRelative(std::int64_t delta);
    void SeekEnd();

protected:
    virtual std::uint64_t DoTell();
    virtual void DoSeek(std::uint64_t position);
    virtual void DoSeekRelative(std::int64_t delta);
    virtual void DoSeekEnd();
    virtual std::uint64_t BinioTell();
    virtual void BinioSeek(std::uint64_t position);
    virtual void BinioSeekRelative(std::int64_t delta);
    virtual void BinioSeekEnd();

private:
    Seeker* fSeeker = nullptr;
};

} // namespace pmutil
