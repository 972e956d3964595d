#include "pmutil/OutputPump.h"

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include <boost/make_shared.hpp>

namespace pmutil {

namespace {

constexpr std::size_t kBlockBytes = std::size_t{1} << 16;

// Cuts blocks into lines.
class LineCutter {
public:
    LineCutter(TakeLine take, std::size_t maxBytes)
        : fTake(std::move(take)), fMaxBytes(std::max<std::size_t>(maxBytes, 1))
    {}

    void Take(std::string_view block)
    {
        if (block.empty())
            return TakeRest();
        for (;;) {
            const std::size_t end = block.find('\n');
            if (end == std::string_view::npos)
                break;
            TakeToEnd(block.substr(0, end));
            block.remove_prefix(end + 1);
        }
        // The last byte stays, in case it belongs to the line's end.
        fBegun.append(block);
        fBegun.erase(0, fBegun.size() - HandOnPieces(fBegun, fMaxBytes + 1).size());
    }

private:
    void TakeToEnd(std::string_view text)
    {
        std::string begun = std::exchange(fBegun, {});
        if (!begun.empty())
            text = begun.append(text);
        if (!text.empty() && text.back() == '\r')
            text.remove_suffix(1);
        HandOn(text);
    }

    void TakeRest()
    {
        const std::string rest = std::exchange(fBegun, {});
        if (!rest.empty())
            HandOn(rest);
    }

    void HandOn(std::string_view line)
    {
        const std::string_view last = HandOnPieces(line, fMaxBytes);
        const bool wasCut = std::exchange(fIsCut, false);
        if (!wasCut || !last.empty())
            fTake(last);
    }

    // Until no more than `maxRest` bytes are left, which it returns.
    std::string_view HandOnPieces(std::string_view line, std::size_t maxRest)
    {
        for (; line.size() > maxRest; fIsCut = true) {
            fTake(line.substr(0, fMaxBytes));
            line.remove_prefix(fMaxBytes);
        }
        return line;
    }

    const TakeLine fTake;
    const std::size_t fMaxBytes;
    std::string fBegun;  // a line without its end so far
    bool fIsCut = false; // a piece of that line was handed on
};

} // namespace

OutputPump::OutputPump(TakeBytes take)
    : fTake(take ? std::move(take) : [](std::string_view /*block*/) {})
{}

void OutputPump::DoRun()
{
    try {
        Pump();
    } catch (...) {
        AwaitStart();
        throw;
    }
    AwaitStart();
}

void OutputPump::Pump()
{
    const boost::shared_ptr<Reader> reader = GetReader();
    std::vector<char> block(kBlockBytes);
    for (;;) {
        std::uint64_t count = 0;
        try {
            count = reader->ReadSome(block.data(), block.size());
        } catch (...) {
            fTake({}); // nothing more comes
            throw;
        }
        fTake({block.data(), static_cast<std::size_t>(count)});
        if (count == 0)
            return;
    }
}

TakeBytes ByLine(TakeLine take, std::size_t maxBytes)
{
    const auto cutter = boost::make_shared<LineCutter>(std::move(take), maxBytes);
    return [cutter](std::string_view block) { cutter->Take(block); };
}

} // namespace pmutil
