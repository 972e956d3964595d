// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A channel that can be written.
#pragma once

#include <cstdint>

#include "pmutil/Channel.h"

namespace pmutil {

class Writer : public virtual Channel {
public:
    // Forwards to `writer`, which may be null; owns it if `own` is true.
    explicit Writer(Writer* writer = nullptr, bool own = false);
    ~Writer() override;

    // Replaces the target, as Channel::SetTarget does.
    void SetWriter(Writer* writer, bool own);

    // The operations below throw std::runtime_error "pmutil::Channel not open" on a closed channel,
    // and what the target throws.

    // Writes at least one and at most `nbytes` bytes and returns the count; returns 0 only if
    // `nbytes` is 0. Throws std::logic_error "DoWriteSome should never return 0 if nbytes > 0" if
    // the target writes nothing.
    std::uint64_t WriteSome(const void* bytes, std::uint64_t nbytes);

    // Writes all bytes. After a failure a part of them may have been written. Throws
    // std::logic_error "WriteFunc should never return 0" if the target writes nothing.
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
