// The last part of a command: its child has ended, and its readers get what is still to be written.
#pragma once

#include <memory>

#include "app/WriterThread.h"

namespace assay_host {

// From its construction on an interrupt ends the process, with the status of an interrupted run.
class Delivery {
public:
    explicit Delivery(std::shared_ptr<WriterThread> writer);
    ~Delivery();
    Delivery(const Delivery&) = delete;
    Delivery& operator=(const Delivery&) = delete;

    // Waits for the readers, however slow they are, and finishes the output. After an interrupt it
    // waits only while they read, after more than one not at all, and ends the process if they
    // don't. Throws what the output throws.
    void Finish() const;

private:
    const std::shared_ptr<WriterThread> fWriter;
    int fInterrupts = 0; // that came before
};

} // namespace assay_host
