// An output task that hands what the child writes to a function.
//
// It reads until the end of the data, and doesn't return before the start of the launch is over,
// however early the child ends. A client with a task of its own calls AwaitStart at the end of
// DoRun for the same effect.
#pragma once

#include <cstddef>
#include <functional>
#include <string_view>

#include "pmutil/OutputTask.h"

namespace pmutil {

// Takes a channel's bytes, block by block as they come, and an empty block at the end of the data.
// The block lasts as long as the call. Called on the channel's own thread; if one function takes
// both channels, two threads call it at the same time.
//
// While it runs, nothing is read: a child that fills the pipe waits. An exception closes the pipe;
// it is stored as a failure of the launch, "stdout: " and its text, which the client's next wait
// throws. A task that was given up goes on to call the function as long as bytes come: it must own
// what it uses.
using TakeBytes = std::function<void(std::string_view block)>;

// Takes a line without its end.
using TakeLine = std::function<void(std::string_view line)>;

class OutputPump : public OutputTask {
public:
    // An empty function drops the bytes.
    explicit OutputPump(TakeBytes take);

protected:
    void DoRun() override;

private:
    void Pump();

    const TakeBytes fTake;
};

// A function for OutputPump that hands on whole lines, as soon as their end has come. A line ends
// with "\n" or "\r\n", and the last one at the end of the data at the latest. A longer line than
// `maxBytes` (at least 1) comes in pieces of that size. The result serves one channel; its copies
// share the begun line.
TakeBytes ByLine(TakeLine take, std::size_t maxBytes = std::size_t{1} << 20);

} // namespace pmutil
