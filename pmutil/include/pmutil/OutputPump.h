// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// An output task that passes the child's output to a function.
//
// Its DoRun reads until the end of the data, and doesn't return before the start of the launch is
// over, even if the child ends early. A client's own task must call AwaitStart at the end of DoRun
// instead.
#pragma once

#include <cstddef>
#include <functional>
#include <string_view>

#include "pmutil/OutputTask.h"

namespace pmutil {

// Consumes a channel's bytes in blocks as they arrive, and an empty block at the end of the data.
// The block is valid during the call. Called on the channel's thread; a function for both channels
// is called by two threads at the same time.
//
// Nothing is read during the call: a child that fills the pipe waits. If the function throws, the
// pipe is closed, and "stdout: " and the text are stored as a failure of the launch, which the
// client's next wait throws. A task that was given up continues to call the function as long as
// bytes arrive, so the function must own the objects that it uses.
using TakeBytes = std::function<void(std::string_view block)>;

// Consumes a line without its end.
using TakeLine = std::function<void(std::string_view line)>;

class OutputPump : public OutputTask {
public:
    // With an empty function, discards the bytes.
    explicit OutputPump(TakeBytes take);

protected:
    void DoRun() override;

private:
    void Pump();

    const TakeBytes fTake;
};

// Returns a function for OutputPump that calls `take` with each line as soon as it is complete. A
// line ends with "\n" or "\r\n", or at the end of the data. A line longer than `maxBytes` (at least
// 1) is split into pieces of that size. Use the result for one channel; its copies share the
// incomplete line.
TakeBytes ByLine(TakeLine take, std::size_t maxBytes = std::size_t{1} << 20);

} // namespace pmutil
