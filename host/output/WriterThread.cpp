#include "output/WriterThread.h"

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <exception>
#include <mutex>
#include <string_view>
#include <thread>
#include <utility>

#include "output/ProgressLine.h"
#include "output/SinkBuffer.h"
#include "output/Stream.h"

namespace assay_host {

namespace {

// Small enough to distinguish a slow reader from one that doesn't read.
constexpr std::size_t kPieceBytes = 4096;

struct Item {
    StandardStream fStream = StandardStream::kOutput;
    std::string fText;
    WriterThread::MakeText fMakeText;               // replaces fText if it isn't empty
    std::function<void(std::ostream&)> fWriteLarge; // replaces both if it isn't empty
};

} // namespace

// Shared with the thread, which may outlive its owner.
struct WriterThread::State {
    State(std::unique_ptr<Output> output, std::function<void()> failed)
        : fOutput(std::move(output)), fFailed(std::move(failed))
    {}

    void Run()
    {
        try {
            fOutput->Open();
            while (WriteNext()) {
            }
            if (!IsAbandoned())
                fOutput->Finish();
        } catch (...) {
            fOutput->Abandon(); // the process may end before ~Output once fDone is set
            Fail(std::current_exception());
        }
        fProgress.Clear();
        const std::lock_guard<std::mutex> lock(fMutex);
        fDone = true;
        fCond.notify_all();
    }

    void Add(Item item)
    {
        const std::lock_guard<std::mutex> lock(fMutex);
        if (fFailure != nullptr)
            return;
        if (CanJoin(item))
            fItems.back().fText += item.fText;
        else
            fItems.push_back(std::move(item));
        fCond.notify_all();
    }

    bool IsAbandoned()
    {
        const std::lock_guard<std::mutex> lock(fMutex);
        return fAbandoned;
    }

    const std::unique_ptr<Output> fOutput;
    const std::function<void()> fFailed;
    std::atomic<std::uint64_t> fPieces{0}; // written so far

    std::mutex fMutex;
    std::condition_variable fCond;
    std::deque<Item> fItems;
    std::optional<std::string> fNewProgress;
    std::exception_ptr fFailure;
    bool fFinishing = false;
    bool fAbandoned = false;
    bool fDone = false;

private:
    // Short texts share an item, which costs memory beyond its text.
    bool CanJoin(const Item& item) const
    {
        const auto isMade = [](const Item& each) { return each.fMakeText || each.fWriteLarge; };
        return !fItems.empty() && !isMade(fItems.back()) && !isMade(item) &&
               fItems.back().fStream == item.fStream &&
               fItems.back().fText.size() + item.fText.size() <= kPieceBytes;
    }

    // Waits for something to write, and writes it. Returns false at the end.
    bool WriteNext()
    {
        Item item;
        std::optional<std::string> progress;
        {
            std::unique_lock<std::mutex> lock(fMutex);
            fCond.wait(lock, [this] {
                return !fItems.empty() || fNewProgress || fFinishing || fAbandoned;
            });
            if (fAbandoned)
                return false;
            if (!fItems.empty()) {
                item = std::move(fItems.front());
                fItems.pop_front();
            } else if (fFinishing) {
                return false;
            } else {
                progress = std::exchange(fNewProgress, std::nullopt);
            }
        }
        if (progress) {
            fProgress.Show(*progress);
        } else {
            fProgress.Clear();
            WriteItem(item);
        }
        return true;
    }

    void WriteItem(const Item& item)
    {
        if (item.fWriteLarge) {
            SinkBuffer buffer([&](std::string_view block) { WritePieces(item.fStream, block); });
            std::ostream out(&buffer);
            out.exceptions(std::ios::badbit);
            item.fWriteLarge(out);
            out.flush();
        } else {
            WritePieces(item.fStream, item.fMakeText ? item.fMakeText() : item.fText);
        }
    }

    void WritePieces(StandardStream stream, std::string_view left)
    {
        while (!left.empty()) {
            const std::string_view piece = left.substr(0, kPieceBytes);
            left.remove_prefix(piece.size());
            if (stream == StandardStream::kOutput)
                fOutput->Write(piece);
            else if (WriteStream(stream, piece))
                return;
            ++fPieces;
        }
    }

    void Fail(const std::exception_ptr& failure)
    {
        {
            const std::lock_guard<std::mutex> lock(fMutex);
            fFailure = failure;
            fItems.clear();
            if (fFinishing)
                return;
        }
        fFailed();
    }

    ProgressLine fProgress;
};

WriterThread::WriterThread(std::unique_ptr<Output> output, std::function<void()> failed)
    : fState(std::make_shared<State>(std::move(output), std::move(failed)))
{
    std::thread([state = fState] { state->Run(); }).detach();
}

WriterThread::~WriterThread()
{
    Abandon();
}

void WriterThread::Write(std::string text)
{
    fState->Add({StandardStream::kOutput, std::move(text), {}, {}});
}

void WriterThread::Write(MakeText makeText)
{
    fState->Add({StandardStream::kOutput, {}, std::move(makeText), {}});
}

void WriterThread::WriteLarge(std::function<void(std::ostream&)> write)
{
    fState->Add({StandardStream::kOutput, {}, {}, std::move(write)});
}

void WriterThread::WriteError(std::string text)
{
    fState->Add({StandardStream::kError, std::move(text), {}, {}});
}

void WriterThread::ShowProgress(std::string text)
{
    const std::lock_guard<std::mutex> lock(fState->fMutex);
    fState->fNewProgress = std::move(text);
    fState->fCond.notify_all();
}

bool WriterThread::Finish(std::optional<std::chrono::milliseconds> patience)
{
    State& state = *fState;
    std::unique_lock<std::mutex> lock(state.fMutex);
    state.fFinishing = true;
    state.fCond.notify_all();
    const auto isDone = [&state] { return state.fDone; };
    if (!patience) {
        state.fCond.wait(lock, isDone);
    } else {
        std::uint64_t before = state.fPieces;
        while (!state.fCond.wait_for(lock, *patience, isDone)) {
            if (state.fPieces == before)
                return false;
            before = state.fPieces;
        }
    }
    // The caller gets the failure: the thread, which may end later, doesn't free it.
    if (state.fFailure != nullptr)
        std::rethrow_exception(std::exchange(state.fFailure, nullptr));
    return true;
}

void WriterThread::Abandon()
{
    {
        const std::lock_guard<std::mutex> lock(fState->fMutex);
        fState->fAbandoned = true;
        fState->fItems.clear();
        fState->fCond.notify_all();
        if (fState->fDone)
            return;
    }
    fState->fOutput->Abandon();
}

} // namespace assay_host
