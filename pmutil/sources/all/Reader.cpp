#include "pmutil/Reader.h"

#include <algorithm>
#include <stdexcept>
#include <utility>

#include "pmutil/Buffer.h"

namespace pmutil {

namespace {

constexpr char kPreviewActive[] = "direct read while preview active";
constexpr char kTooMuchRead[] = "read returned more than asked";
constexpr std::uint32_t kNoByte = 0xFFFFFFFF;

} // namespace

Reader::Reader(Reader* reader, bool own) : fReader(reader)
{
    if (reader != nullptr)
        SetTarget(reader, own);
}

Reader::~Reader() = default;

void Reader::SetReader(Reader* reader, bool own)
{
    SetTarget(reader, own);
    if (fReader != reader)
        DropPushback();
    fReader = reader;
}

std::uint64_t Reader::ReadSome(void* bytes, std::uint64_t nbytes)
{
    if (fPreviewer != nullptr)
        throw std::runtime_error(kPreviewActive);
    RequireOpen();
    if (nbytes == 0)
        return 0;
    const std::uint64_t count = DoReadSome(bytes, nbytes);
    if (count > nbytes)
        throw std::logic_error(kTooMuchRead);
    return count;
}

bool Reader::ReadAll(void* bytes, std::uint64_t nbytes)
{
    if (fPreviewer != nullptr)
        throw std::logic_error(kPreviewActive);
    RequireOpen();
    auto* const first = static_cast<unsigned char*>(bytes);
    std::uint64_t done = 0;
    while (done < nbytes) {
        const std::uint64_t count = DoReadSome(first + done, nbytes - done);
        if (count > nbytes - done)
            throw std::logic_error(kTooMuchRead);
        if (count == 0)
            break;
        done += count;
    }
    if (done == nbytes)
        return true;
    if (done > 0)
        PutBack(first, done);
    return false;
}

void Reader::Unread(const void* bytes, std::uint64_t nbytes)
{
    RequireOpen();
    PutBack(bytes, nbytes);
}

void Reader::PutBack(const void* bytes, std::uint64_t nbytes)
{
    auto pushback = std::make_unique<Buffer>(nbytes);
    pushback->CopyIn(bytes, nbytes);
    pushback->Seek(0);
    fPushback = std::move(pushback);
    DoUnread(nbytes);
}

void Reader::BeginPreview(Previewer& previewer)
{
    if (fPreviewer != nullptr)
        throw std::runtime_error("Reader: Previewer already active");
    fPreviewer = &previewer;
}

std::uint64_t Reader::ReadPreview(void* bytes, std::uint64_t nbytes)
{
    struct Suspension {
        explicit Suspension(Previewer*& place) : fPlace(place), fActive(place) { place = nullptr; }
        ~Suspension() { fPlace = fActive; }
        Suspension(const Suspension&) = delete;
        Suspension& operator=(const Suspension&) = delete;
        Previewer*& fPlace;
        Previewer* fActive;
    };
    const Suspension suspension(fPreviewer);
    return ReadSome(bytes, nbytes);
}

void Reader::EndPreview(std::unique_ptr<Buffer> data)
{
    fPreviewer = nullptr;
    if (std::exchange(fPreviewIsStale, false))
        return;
    if (fPushback != nullptr) {
        // The preview read its bytes from the pushback, which still has them.
        fPushback->SeekRelative(-static_cast<std::int64_t>(data->GetEndOfData()));
        return;
    }
    data->SetOffset(0);
    const std::uint64_t count = data->GetEndOfData();
    fPushback = std::move(data);
    DoUnread(count);
}

std::uint64_t Reader::DoReadSome(void* bytes, std::uint64_t nbytes)
{
    if (fPushback != nullptr) {
        const std::uint64_t count =
            std::min(nbytes, fPushback->GetEndOfData() - fPushback->GetOffset());
        fPushback->CopyOut(bytes, count);
        if (fPushback->GetOffset() == fPushback->GetEndOfData())
            fPushback.reset();
        if (count > 0)
            return count;
    }
    return BinioReadSome(bytes, nbytes);
}

std::uint64_t Reader::BinioReadSome(void* bytes, std::uint64_t nbytes)
{
    RequireTarget(fReader);
    return fReader->ReadSome(bytes, nbytes);
}

void Reader::DoUnread(std::uint64_t /*nbytes*/) {}

std::uint32_t Reader::DoReadByte()
{
    unsigned char byte = 0;
    return DoReadSome(&byte, 1) == 0 ? kNoByte : byte;
}

void Reader::DoClose()
{
    Channel::DoClose();
    DropPushback();
}

void Reader::DropPushback()
{
    fPushback.reset();
    // During ReadPreview fPreviewer is null, and fPreviewIsStale doesn't change.
    if (fPreviewer != nullptr)
        fPreviewIsStale = true;
}

} // namespace pmutil
