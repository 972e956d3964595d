#include "pmutil/Seeker.h"

namespace pmutil {

Seeker::Seeker(Seeker* seeker, bool own) : fSeeker(seeker)
{
    if (seeker != nullptr)
        SetTarget(seeker, own);
}

Seeker::~Seeker() = default;

void Seeker::SetSeeker(Seeker* seeker, bool own)
{
    SetTarget(seeker, own);
    fSeeker = seeker;
}

std::uint64_t Seeker::Tell()
{
    RequireOpen();
    return DoTell();
}

void Seeker::Seek(std::uint64_t position)
{
    RequireOpen();
    DoSeek(position);
}

void Seeker::SeekRelative(std::int64_t delta)
{
    RequireOpen();
    DoSeekRelative(delta);
}

void Seeker::SeekEnd()
{
    RequireOpen();
    DoSeekEnd();
}

std::uint64_t Seeker::DoTell()
{
    return BinioTell();
}

void Seeker::DoSeek(std::uint64_t position)
{
    BinioSeek(position);
}

void Seeker::DoSeekRelative(std::int64_t delta)
{
    BinioSeekRelative(delta);
}

void Seeker::DoSeekEnd()
{
    BinioSeekEnd();
}

std::uint64_t Seeker::BinioTell()
{
    RequireTarget(fSeeker);
    return fSeeker->Tell();
}

void Seeker::BinioSeek(std::uint64_t position)
{
    RequireTarget(fSeeker);
    fSeeker->Seek(position);
}

void Seeker::BinioSeekRelative(std::int64_t delta)
{
    RequireTarget(fSeeker);
    fSeeker->SeekRelative(delta);
}

void Seeker::BinioSeekEnd()
{
    RequireTarget(fSeeker);
    fSeeker->SeekEnd();
}

} // namespace pmutil
