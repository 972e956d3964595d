// Writes the output of a run on a thread of its own: only that thread waits for a reader.
#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <ostream>
#include <string>

#include "output/Output.h"

namespace assay_host {

// Keeps each text until it is written, without a limit of its own: the limits of the report's
// reader bound what comes from a child.
//
// Any thread may call. Call Finish once; only Abandon may follow.
class WriterThread {
public:
    // Called once, on the writer's thread, when its turn has come.
    using MakeText = std::function<std::string()>;

    // `failed` is called on the writer's thread if the output fails before Finish. Texts after a
    // failure are dropped.
    WriterThread(std::unique_ptr<Output> output, std::function<void()> failed);

    // Abandons what isn't written, without waiting.
    ~WriterThread();
    WriterThread(const WriterThread&) = delete;
    WriterThread& operator=(const WriterThread&) = delete;

    // To the output. Pass a MakeText for a text that is larger than what it is made of: it is held
    // only while it is written.
    void Write(std::string text);
    void Write(MakeText makeText);

    // The same for a text that is never held whole: `write` is called once, on the writer's thread,
    // when its turn has come.
    void WriteLarge(std::function<void(std::ostream&)> write);

    // To standard error. If that fails, the text is lost.
    void WriteError(std::string text);

    // If standard error is a terminal, shows one line of progress as soon as nothing else is to be
    // written. The next line replaces it.
    void ShowProgress(std::string text);

    // Waits until all is written and the output is finished. Throws the failure of the output if it
    // had one. With a patience, returns false once nothing could be written for so long.
    bool Finish(std::optional<std::chrono::milliseconds> patience);

    // Gives up what isn't written. A thread that waits for a reader goes on until the process ends.
    void Abandon();

private:
    struct State;
    const std::shared_ptr<State> fState;
};

} // namespace assay_host
