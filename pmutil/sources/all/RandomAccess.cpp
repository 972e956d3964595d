#include "pmutil/RandomAccess.h"

namespace pmutil {

RandomAccess::RandomAccess(RandomAccess* target, bool own)
{
    if (target != nullptr)
        SetRandomAccess(target, own);
}

RandomAccess::~RandomAccess() = default;

void RandomAccess::SetRandomAccess(RandomAccess* target, bool own)
{
    SetReader(target, own);
    SetWriter(target, false);
    SetSeeker(target, false);
}

void RandomAccess::SetEOF()
{
    RequireOpen();
    DoSetEOF();
}

void RandomAccess::DoSeek(std::uint64_t position)
{
    Seeker::DoSeek(position);
    DropPushback();
}

void RandomAccess::DoSeekRelative(std::int64_t delta)
{
    Seeker::DoSeekRelative(delta);
    DropPushback();
}

void RandomAccess::DoSeekEnd()
{
    Seeker::DoSeekEnd();
    DropPushback();
}

void RandomAccess::DoSetEOF()
{
    BinioSetEOF();
}

void RandomAccess::BinioSetEOF()
{
    // Null if the target isn't a RandomAccess; RequireTarget then throws.
    auto* const target = dynamic_cast<RandomAccess*>(GetTarget());
    RequireTarget(target);
    if (target != nullptr)
        target->SetEOF();
}

} // namespace pmutil
