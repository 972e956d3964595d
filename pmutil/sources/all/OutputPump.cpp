#include "pmutil/OutputPump.h"

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include <boost/make_shared.hpp>

namespace pmutil {

namespace {

constexpr std::size_t kBlockBytes = std::size_t{1} << 16;

// Splits blocks into lines.
class LineSplitter {
public:
    LineSplitter(TakeLine take, std::size_t maxBytes)
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
        // Keep one byte more than a piece: it may be the "\r" of the line's end.
        fPartialLine.append(block);
        const std::size_t rest = TakePieces(fPartialLine, fMaxBytes + 1).size();
        fPartialLine.erase(0, fPartialLine.size() - rest);
    }

private:
    void TakeToEnd(std::string_view text)
    {
        std::string line = std::exchange(fPartialLine, {});
        if (!line.empty())
            text = line.append(text);
        if (!text.empty() && text.back() == '\r')
            text.remove_suffix(1);
        TakeWholeLine(text);
    }

    void TakeRest()
    {
        const std::string rest = std::exchange(fPartialLine, {});
        if (!rest.empty())
            TakeWholeLine(rest);
    }

    void TakeWholeLine(std::string_view line)
    {
        const std::string_view last = TakePieces(line, fMaxBytes);
        const bool wasSplit = std::exchange(fIsSplit, false);
        if (!wasSplit || !last.empty())
            fTake(last);
    }

    // Passes on pieces of the line until at most `maxRest` bytes are left; returns these.
    std::string_view TakePieces(std::string_view line, std::size_t maxRest)
    {
        for (; line.size() > maxRest; fIsSplit = true) {
            fTake(line.substr(0, fMaxBytes));
            line.remove_prefix(fMaxBytes);
        }
        return line;
    }

    const TakeLine fTake;
    const std::size_t fMaxBytes;
    std::string fPartialLine; // the bytes of a line whose end hasn't arrived
    bool fIsSplit = false;    // a piece of that line was passed on
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
            fTake({}); // the end of the data
            throw;
        }
        fTake({block.data(), static_cast<std::size_t>(count)});
        if (count == 0)
            return;
    }
}

TakeBytes ByLine(TakeLine take, std::size_t maxBytes)
{
    const auto splitter = boost::make_shared<LineSplitter>(std::move(take), maxBytes);
    return [splitter](std::string_view block) { splitter->Take(block); };
}

} // namespace pmutil
