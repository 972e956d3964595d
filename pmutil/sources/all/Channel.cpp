#include "pmutil/Channel.h"

#include <stdexcept>

namespace pmutil {

Channel::Channel(Channel* target, bool own)
{
    SetTarget(target, own);
}

Channel::~Channel() = default;

void Channel::Close()
{
    if (IsOpen())
        DoClose();
}

bool Channel::IsOpen() const
{
    return DoIsOpen();
}

void Channel::SetTarget(Channel* target, bool own)
{
    if (target != fOwnedTarget.get())
        fOwnedTarget.reset(own ? target : nullptr);
    fTarget = target;
}

void Channel::DoClose()
{
    BinioClose();
}

bool Channel::DoIsOpen() const
{
    return BinioIsOpen();
}

void Channel::BinioClose()
{
    RequireTarget(fTarget);
    fTarget->Close();
}

bool Channel::BinioIsOpen() const
{
    RequireTarget(fTarget);
    return fTarget->IsOpen();
}

void Channel::RequireOpen() const
{
    if (!IsOpen())
        throw std::runtime_error("pmutil::Channel not open");
}

void Channel::RequireTarget(const Channel* target) const
{
    if (target == nullptr || target != fTarget)
        throw std::runtime_error("pmutil binio function override required");
}

} // namespace pmutil
