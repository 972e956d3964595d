// The root of the byte streams: what can be opened and closed.
//
// A channel either does its own work, or stands over a target channel and forwards to it. Callers
// use the public operations, which check; a channel that does its own work overrides the `Binio`
// operations, and the `Do` operations where it needs a say above them (pushback, buffering).
//
// Channels have no locks: an object serves one thread at a time.
#pragma once

#include <boost/shared_ptr.hpp>

namespace pmutil {

class Channel {
public:
    // Forwards to `target`, which may be null. With `own` set the target is deleted with this
    // object.
    explicit Channel(Channel* target = nullptr, bool own = false);
    virtual ~Channel();
    Channel(const Channel&) = delete;
    Channel& operator=(const Channel&) = delete;

    // Closes an open channel; a closed one stays as it is.
    void Close();

    // Throws std::runtime_error "pmutil binio function override required" if the channel neither
    // has a target nor does its own work.
    bool IsOpen() const;

    // Replaces the target. An owned target that is replaced by another one is deleted, whatever
    // still forwards to it; the same target once more keeps the ownership that it has.
    void SetTarget(Channel* target, bool own);

protected:
    virtual void DoClose();
    virtual bool DoIsOpen() const;
    virtual void BinioClose();
    virtual bool BinioIsOpen() const;

    // Throws std::runtime_error "pmutil::Channel not open" unless IsOpen().
    void RequireOpen() const;

    // Throws std::runtime_error "pmutil binio function override required" unless `target` exists
    // and is the one that this channel forwards to.
    void RequireTarget(const Channel* target) const;

    Channel* GetTarget() const { return fTarget; }

private:
    Channel* fTarget = nullptr;
    boost::shared_ptr<Channel> fOwnedTarget;
};

} // namespace pmutil
