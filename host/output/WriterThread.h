// Writes the output of a run on a thread of its own, so that only this thread blocks if a reader
// doesn't read.
#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <ostream>
#include <string>

#include "output/Output.h"

namespace assay_host {

// Holds every text until it is written. The queue has no limit of its own: the limits of
// ReportReader and ErrorLines bound what a child can cause to be written.
//
// Any thread may call. Call Finish once; only Abandon may follow.
class WriterThread {
public:
    // Makes a text. Called once, on the writer's thread, just before the text is written.
    using MakeText = std::function<std::string()>;

    // Starts the thread. `failed` is called on it if the output fails before Finish. Texts after a
    // failure are dropped.
    WriterThread(std::unique_ptr<Output> output, std::function<void()> failed);

    // Calls Abandon.
    ~WriterThread();
    WriterThread(const WriterThread&) = delete;
    WriterThread& operator=(const WriterThread&) = delete;

    // Queues a text for the output. Pass a MakeText if the text is larger than the data that it is
    // made of.
    void Write(std::string text);
    void Write(MakeText makeText);

    // Queues a text that is never held as a whole: `write` is called once, on the writer's thread,
    // with a stream to the output.
    void WriteLarge(std::function<void(std::ostream&)> write);

    // Queues a text for standard error. It is lost if it can't be written.
    void WriteError(std::string text);

    // Sets the line of progress, which is shown while the queue is empty, if standard error is a
    // terminal.
    void ShowProgress(std::string text);

    // Waits until everything is written and the output is finished, and returns true. Throws the
    // output's exception if it failed. With a patience, by the steady clock, returns false when
    // nothing could be written for that long.
    bool Finish(std::optional<std::chrono::milliseconds> patience);

    // Drops the queue and abandons the output, without waiting. If the thread is blocked in a
    // write, it stays so until the process ends.
    void Abandon();

private:
    struct State;
    const std::shared_ptr<State> fState;
};

} // namespace assay_host
