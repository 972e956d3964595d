// Random operations on a Buffer, compared at each step with a simple model.
#include <algorithm>
#include <array>
#include <gtest/gtest.h>
#include <optional>
#include <random>
#include <string>
#include <vector>

#include "pmutil/Buffer.h"
#include "pmutil/Previewer.h"
#include "pmutil/XUnderrun.h"

using namespace pmutil;

namespace {

constexpr int kOperations = 1'000'000;
constexpr int kParts = 10;
constexpr std::uint64_t kMaxBytes = 20'000; // keeps the blocks small, and the growth frequent

// The text of an error; empty if there is none.
using Outcome = std::string;

class Model {
public:
    explicit Model(std::uint64_t capacity) : fBytes(capacity, kUnknown) {}

    static constexpr int kUnknown = -1; // a byte that was never written

    std::vector<int> fBytes;
    std::uint64_t fOffset = 0, fEnd = 0, fDirtyBegin = 0, fDirtyEnd = 0;
    std::optional<std::vector<int>> fPushback;

    std::vector<int> ReadSome(std::uint64_t most)
    {
        std::vector<int> result;
        if (most == 0)
            return result;
        if (fPushback) {
            const auto count = std::min<std::uint64_t>(most, fPushback->size());
            result.assign(fPushback->begin(), At(*fPushback, count));
            fPushback->erase(fPushback->begin(), At(*fPushback, count));
            if (fPushback->empty())
                fPushback.reset();
            if (count > 0)
                return result;
        }
        const auto count = std::min(most, fEnd - fOffset);
        result.assign(At(fBytes, fOffset), At(fBytes, fOffset + count));
        fOffset += count;
        return result;
    }

    void MoveTo(std::uint64_t position)
    {
        fOffset = position;
        fPushback.reset();
    }

    bool ReadAll(std::uint64_t wanted, std::vector<int>& all)
    {
        while (all.size() < wanted) {
            const auto part = ReadSome(wanted - all.size());
            if (part.empty())
                break;
            all.insert(all.end(), part.begin(), part.end());
        }
        if (all.size() < wanted && !all.empty())
            fPushback = all;
        return all.size() == wanted;
    }

    void Put(const std::string& bytes)
    {
        for (const char byte : bytes)
            fBytes[fOffset++] = static_cast<unsigned char>(byte);
        if (!bytes.empty()) {
            fDirtyBegin = std::min(fDirtyBegin, fOffset - bytes.size());
            fDirtyEnd = std::max(fDirtyEnd, fOffset);
            fEnd = std::max(fEnd, fOffset);
        }
    }

    std::uint64_t WriteSome(const std::string& bytes)
    {
        if (bytes.empty())
            return 0;
        if (fOffset == fBytes.size())
            Grow(bytes.size());
        const auto count = std::min<std::uint64_t>(bytes.size(), fBytes.size() - fOffset);
        Put(bytes.substr(0, count));
        return count;
    }

    void Resize(std::uint64_t capacity)
    {
        fBytes.resize(capacity, kUnknown);
        std::fill(At(fBytes, fEnd), fBytes.end(), kUnknown);
    }

    void Grow(std::uint64_t extra)
    {
        std::uint64_t capacity = 0;
        while (capacity < fBytes.size() + extra)
            capacity += 4096;
        Resize(capacity);
    }

    bool IsValid(std::uint64_t offset, std::uint64_t end, std::uint64_t dirtyBegin,
                 std::uint64_t dirtyEnd) const
    {
        return offset <= end && end <= fBytes.size() && dirtyBegin <= dirtyEnd && dirtyEnd <= end;
    }

private:
    static std::vector<int>::iterator At(std::vector<int>& bytes, std::uint64_t index)
    {
        return bytes.begin() + static_cast<std::ptrdiff_t>(index);
    }
};

template <typename Call>
Outcome Try(Call call)
{
    try {
        call();
    } catch (const std::exception& error) {
        return error.what();
    }
    return {};
}

class ModelRun {
public:
    explicit ModelRun(std::uint64_t seed) : fRandom(seed) {}

    void Run(int operations)
    {
        for (int step = 0; step < operations; ++step) {
            Step();
            if (testing::Test::HasFailure()) {
                ADD_FAILURE() << "at step " << step;
                return;
            }
        }
    }

private:
    std::uint64_t Below(std::uint64_t limit) { return fRandom() % limit; }

    // Mostly small, sometimes large, and often at or next to a bound of the buffer.
    std::uint64_t Size()
    {
        switch (Below(8)) {
        case 0:
            return Below(9000);
        case 1:
            return fModel.fBytes.size() - fModel.fOffset + Below(2);
        case 2:
            return fModel.fEnd - fModel.fOffset + Below(2);
        default:
            return Below(40);
        }
    }

    std::uint64_t Position()
    {
        const std::array<std::uint64_t, 5> bounds{fModel.fOffset, fModel.fEnd, fModel.fDirtyBegin,
                                                  fModel.fDirtyEnd, fModel.fBytes.size()};
        return Below(3) == 0 ? bounds[Below(bounds.size())] + Below(3) : Below(fModel.fEnd + 2);
    }

    std::string Bytes(std::uint64_t size)
    {
        std::string bytes(size, static_cast<char>(fRandom()));
        for (std::size_t at = 0; at < bytes.size(); at += 1 + at / 8)
            bytes[at] = static_cast<char>(fRandom());
        return bytes;
    }

    void ExpectBytes(const std::vector<int>& expected, const unsigned char* actual)
    {
        for (std::size_t at = 0; at < expected.size(); ++at) {
            if (expected[at] != Model::kUnknown && expected[at] != actual[at]) {
                ADD_FAILURE() << "byte " << at << " is " << int{actual[at]} << " and not "
                              << expected[at];
                return;
            }
        }
    }

    // `read` returns the count. The bytes are compared with the model's.
    template <typename Read>
    void CheckRead(std::uint64_t size, Read read)
    {
        std::vector<unsigned char> actual(size);
        const std::uint64_t count = read(actual.data());
        const auto expected = fModel.ReadSome(size);
        ASSERT_EQ(count, expected.size());
        ExpectBytes(expected, actual.data());
    }

    void CheckReadAll(std::uint64_t size)
    {
        std::vector<unsigned char> actual(size);
        std::vector<int> expected;
        ASSERT_EQ(fBuffer.ReadAll(actual.data(), size), fModel.ReadAll(size, expected));
        ExpectBytes(expected, actual.data());
    }

    // Reads ahead in pieces of random size, and checks that all bytes are read again.
    void CheckPreview()
    {
        Previewer preview(fBuffer);
        Model copy = fModel;
        for (std::uint64_t reads = Below(4); reads > 0; --reads) {
            const std::uint64_t size = Size();
            std::vector<unsigned char> actual(size);
            const std::uint64_t count = preview.ReadSome(actual.data(), size);
            const auto expected = copy.ReadSome(size);
            ASSERT_EQ(count, expected.size());
            ExpectBytes(expected, actual.data());
            fSeen.insert(fSeen.end(), expected.begin(), expected.end());
        }
        preview.End();
        // The bytes of the pushback are there again, followed by those read from the buffer.
        if (copy.fPushback)
            fSeen.clear();
        else
            fModel = copy;
        if (!fModel.fPushback && !fSeen.empty())
            fModel.fPushback = fSeen;
        fSeen.clear();
    }

    void Expect(bool valid, const Outcome& outcome, const char* text)
    {
        ASSERT_EQ(outcome, valid ? "" : text);
    }

    void Step()
    {
        const std::uint64_t size = Size();
        const std::uint64_t position = Position();
        switch (Below(19)) {
        case 0:
        case 1:
            CheckRead(size, [&](void* to) { return fBuffer.ReadSome(to, size); });
            break;
        case 2:
            CheckReadAll(size);
            break;
        case 3: {
            const std::string bytes = Bytes(size);
            fBuffer.Unread(bytes.data(), bytes.size());
            std::vector<int> codes;
            for (const char byte : bytes)
                codes.push_back(static_cast<unsigned char>(byte));
            fModel.fPushback = codes;
            break;
        }
        case 4:
        case 5: {
            const std::string bytes = Bytes(size);
            ASSERT_EQ(fBuffer.WriteSome(bytes.data(), bytes.size()), fModel.WriteSome(bytes));
            break;
        }
        case 6: {
            std::string bytes = Bytes(size);
            fBuffer.WriteAll(bytes.data(), bytes.size());
            while (!bytes.empty())
                bytes.erase(0, fModel.WriteSome(bytes));
            break;
        }
        case 7: {
            const std::string bytes = Bytes(size);
            fBuffer.CopyIn(bytes.data(), bytes.size());
            if (size > fModel.fBytes.size() - fModel.fOffset)
                fModel.Grow(size - (fModel.fBytes.size() - fModel.fOffset));
            fModel.Put(bytes);
            break;
        }
        case 8: {
            const bool valid = size <= fModel.fEnd - fModel.fOffset;
            std::vector<unsigned char> actual(size);
            const auto outcome = Try([&] { fBuffer.CopyOut(actual.data(), size); });
            Expect(valid, outcome, "Buffer: CopyOut nbytes too large");
            if (valid) {
                std::vector<int> expected;
                for (std::uint64_t at = 0; at < size; ++at)
                    expected.push_back(fModel.fBytes[fModel.fOffset++]);
                ExpectBytes(expected, actual.data());
            }
            break;
        }
        case 9: {
            const bool valid = position <= fModel.fEnd;
            Expect(valid, Try([&] { fBuffer.Seek(position); }), "Buffer: bad offset param");
            if (valid)
                fModel.MoveTo(position);
            break;
        }
        case 10: {
            const auto delta =
                static_cast<std::int64_t>(position) - static_cast<std::int64_t>(size);
            const std::int64_t sum = static_cast<std::int64_t>(fModel.fOffset) + delta;
            const bool valid = sum >= 0 && sum <= static_cast<std::int64_t>(fModel.fEnd);
            Expect(valid, Try([&] { fBuffer.SeekRelative(delta); }),
                   sum < 0 ? "Buffer: offset would be negative" : "Buffer: bad offset param");
            if (valid)
                fModel.MoveTo(static_cast<std::uint64_t>(sum));
            break;
        }
        case 11:
            fBuffer.SeekEnd();
            fModel.MoveTo(fModel.fEnd);
            break;
        case 12: {
            const bool valid =
                fModel.IsValid(fModel.fOffset, position, fModel.fDirtyBegin, fModel.fDirtyEnd);
            Expect(valid, Try([&] { fBuffer.SetEndOfData(position); }),
                   "Buffer: bad endOfData param");
            if (valid)
                fModel.fEnd = position;
            break;
        }
        case 13: {
            const std::uint64_t begin = Position();
            const bool valid = fModel.IsValid(fModel.fOffset, fModel.fEnd, begin, position);
            Expect(valid, Try([&] { fBuffer.SetDirtyBounds(begin, position); }),
                   "Buffer: bad dirty bounds");
            if (valid) {
                fModel.fDirtyBegin = begin;
                fModel.fDirtyEnd = position;
            }
            break;
        }
        case 14: {
            const std::array<std::uint64_t, 4> state{Position(), Position(), Position(),
                                                     Position()};
            const bool valid = fModel.IsValid(state[0], state[1], state[2], state[3]);
            Expect(valid, Try([&] { fBuffer.SetState(state[0], state[1], state[2], state[3]); }),
                   "Buffer::SetState: bad args");
            if (valid) {
                fModel.MoveTo(state[0]);
                fModel.fEnd = state[1];
                fModel.fDirtyBegin = state[2];
                fModel.fDirtyEnd = state[3];
            }
            break;
        }
        case 15:
            fBuffer.Grow(size);
            fModel.Grow(size);
            break;
        case 16: {
            const bool valid = position >= fModel.fEnd;
            Expect(valid, Try([&] { fBuffer.SetCapacity(position); }),
                   "shrinking Buffer would invalidate data");
            if (valid && position != fModel.fBytes.size())
                fModel.Resize(position);
            break;
        }
        case 17:
            fBuffer.SetEOF();
            if (fModel.fOffset != fModel.fBytes.size()) {
                fModel.fEnd = fModel.fOffset;
                fModel.fDirtyBegin = std::min(fModel.fDirtyBegin, fModel.fOffset);
                fModel.fDirtyEnd = std::min(fModel.fDirtyEnd, fModel.fOffset);
                fModel.Resize(fModel.fOffset);
            }
            break;
        case 18:
            CheckPreview();
            break;
        }
        ExpectSameState();
        if (fModel.fBytes.size() > kMaxBytes)
            StartOver();
    }

    void StartOver()
    {
        fBuffer = Buffer(100);
        fModel = Model(100);
    }

    void ExpectSameState()
    {
        ASSERT_EQ(fBuffer.Tell(), fModel.fOffset);
        ASSERT_EQ(fBuffer.GetEndOfData(), fModel.fEnd);
        ASSERT_EQ(fBuffer.GetCapacity(), fModel.fBytes.size());
        ASSERT_EQ(fBuffer.GetDirtyBegin(), fModel.fDirtyBegin);
        ASSERT_EQ(fBuffer.GetDirtyEnd(), fModel.fDirtyEnd);
    }

    std::mt19937_64 fRandom;
    Buffer fBuffer{100};
    Model fModel{100};
    std::vector<int> fSeen;
};

// A part of a million operations, so that several processes can share the work.
class ChannelModel : public testing::TestWithParam<int> {};

TEST_P(ChannelModel, AgreesAfterRandomOperations)
{
    const std::uint64_t seed = std::random_device{}();
    SCOPED_TRACE("seed " + std::to_string(seed));
    RecordProperty("seed", std::to_string(seed));
    ModelRun(seed).Run(kOperations / kParts);
}

INSTANTIATE_TEST_SUITE_P(Part, ChannelModel, testing::Range(0, kParts));

} // namespace
