// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// The base class of the byte streams: open and closed state, and the target of forwarding.
//
// A channel either implements its operations or forwards them to a target channel. Callers use the
// public operations, which check their preconditions. An implementing channel overrides the `Binio`
// operations, and the `Do` operations for what is above them (pushback, buffering).
//
// Channels have no locks: use an object from one thread at a time.
#pragma once

#include <boost/shared_ptr.hpp>

namespace pmutil {

class Channel {
public:
    // Forwards to `target`, which may be null. If `own` is true, this object deletes the target.
    explicit Channel(Channel* target = nullptr, bool own = false);
    virtual ~Channel();
    Channel(const Channel&) = delete;
    Channel& operator=(const Channel&) = delete;

    // Closes the channel. Does nothing if it is closed.
    void Close();

    // Throws std::runtime_error "pmutil binio function override required" if the channel has
    // neither a target nor an implementation.
    bool IsOpen() const;

    // Replaces the target. An owned target is deleted if another one replaces it, even if other
    // channels forward to it. If `target` is the present one, its ownership doesn't change.
    void SetTarget(Channel* target, bool own);

protected:
    virtual void DoClose();
    virtual bool DoIsOpen() const;
    virtual void BinioClose();
    virtual bool BinioIsOpen() const;

    // Throws std::runtime_error "pmutil::Channel not open" unless IsOpen().
    void RequireOpen() const;

    // Throws std::runtime_error "pmutil binio function override required" if `target` is null or
    // not the target of this channel.
    void RequireTarget(const Channel* target) const;

    Channel* GetTarget() const { return fTarget; }

private:
    Channel* fTarget = nullptr;
    boost::shared_ptr<Channel> fOwnedTarget;
};

} // namespace pmutil
