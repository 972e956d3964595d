// A channel that records its calls and answers from a script.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <deque>
#include <string>
#include <vector>

#include "pmutil/RandomAccess.h"

class FakeChannel : public pmutil::RandomAccess {
public:
    ~FakeChannel() override
    {
        if (fDestroyed != nullptr)
            ++*fDestroyed;
    }

    // The calls so far, as text.
    std::vector<std::string> fCalls;
    // The data of reads, at most one piece per call.
    std::deque<std::string> fPieces;
    std::string fWritten;
    std::uint64_t fMostPerWrite = UINT64_MAX;
    // Reads claim this many bytes more than requested.
    std::uint64_t fExcess = 0;
    bool fOpen = true;
    int* fDestroyed = nullptr;
    std::uint64_t fPosition = 0;

    std::uint32_t ReadOneByte() { return DoReadByte(); }

protected:
    void BinioClose() override
    {
        fCalls.emplace_back("close");
        fOpen = false;
    }

    bool BinioIsOpen() const override { return fOpen; }

    std::uint64_t BinioReadSome(void* bytes, std::uint64_t nbytes) override
    {
        fCalls.push_back("read " + std::to_string(nbytes));
        if (fExcess > 0)
            return nbytes + fExcess;
        if (fPieces.empty())
            return 0;
        std::string& piece = fPieces.front();
        const std::uint64_t count = std::min<std::uint64_t>(nbytes, piece.size());
        std::memcpy(bytes, piece.data(), count);
        piece.erase(0, count);
        if (piece.empty())
            fPieces.pop_front();
        return count;
    }

    void DoUnread(std::uint64_t nbytes) override
    {
        fCalls.push_back("unread " + std::to_string(nbytes));
    }

    std::uint64_t BinioWriteSome(const void* bytes, std::uint64_t nbytes) override
    {
        fCalls.push_back("write " + std::to_string(nbytes));
        const std::uint64_t count = std::min(nbytes, fMostPerWrite);
        fWritten.append(static_cast<const char*>(bytes), count);
        return count;
    }

    void DoFlush() override { fCalls.emplace_back("flush"); }

    std::uint64_t BinioTell() override
    {
        fCalls.emplace_back("tell");
        return fPosition;
    }

    void BinioSeek(std::uint64_t position) override
    {
        fCalls.push_back("seek " + std::to_string(position));
    }

    void BinioSeekRelative(std::int64_t delta) override
    {
        fCalls.push_back("seek relative " + std::to_string(delta));
    }

    void BinioSeekEnd() override { fCalls.emplace_back("seek end"); }
    void BinioSetEOF() override { fCalls.emplace_back("set EOF"); }
};
