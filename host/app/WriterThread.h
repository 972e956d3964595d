// Writes what a run says, on a thread of its own: nobody but that thread waits for a reader.
#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <ostream>
#include <string>

#include "app/Output.h"

namespace assay_host {

// What waits is kept until it is written. Who hands it over bounds it: of a child that is what the
// limits of its reader let through.
//
// Any thread may call, but Finish is called once and is the last of all but Abandon.
class WriterThread {
public:
    // Called once, on the writer's thread, when its turn has come.
    using MakeText = std::function<std::string()>;

    // `failed` is called on the writer's thread if the output fails before Finish. What comes after
    // a failure is dropped.
    WriterThread(std::unique_ptr<Output> output, std::function<void()> failed);

    // Doesn't wait: what isn't written by now is abandoned.
    ~WriterThread();
    WriterThread(const WriterThread&) = delete;
    WriterThread& operator=(const WriterThread&) = delete;

    // To the output. What grows when it is put into its form is better made when it is written.
    void Write(std::string text);
    void Write(MakeText makeText);

    // The same for a text that is never held whole: `write` is called once, on the writer's thread,
    // when its turn has come.
    void WriteLarge(std::function<void(std::ostream&)> write);

    // To standard error. If that fails, the text is lost.
    void WriteError(std::string text);

    // Shows one line of progress, where standard error is a terminal, as soon as nothing else is to
    // be written; the next one takes its place.
    void ShowProgress(std::string text);

    // Waits until all is written and the output is finished, and throws the failure of the output
    // if it had one. With a patience it is given up once nothing could be written for so long;
    // false then.
    bool Finish(std::optional<std::chrono::milliseconds> patience);

    // Gives up what isn't written. A thread that waits for a reader goes on until the process ends.
    void Abandon();

private:
    struct State;
    const std::shared_ptr<State> fState;
};

} // namespace assay_host
