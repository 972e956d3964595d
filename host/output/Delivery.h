// The last part of a command: its child has ended, and the rest of the output is written.
#pragma once

#include <memory>

#include "output/WriterThread.h"

namespace assay_host {

// From its construction on an interrupt ends the process with the status of an interrupted run.
class Delivery {
public:
    explicit Delivery(std::shared_ptr<WriterThread> writer);
    ~Delivery();
    Delivery(const Delivery&) = delete;
    Delivery& operator=(const Delivery&) = delete;

    // Waits without limit for the readers and finishes the output. After one interrupt it waits
    // only while they read, after more interrupts not at all; ends the process if the output isn't
    // written then. Throws what the output throws.
    void Finish() const;

private:
    const std::shared_ptr<WriterThread> fWriter;
    int fInterrupts = 0; // before the construction
};

} // namespace assay_host
