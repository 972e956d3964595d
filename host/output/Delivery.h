// Finishes the output of a command after its child has ended.
#pragma once

#include <memory>

#include "output/WriterThread.h"

namespace assay_host {

// From its construction on, an interrupt ends the process with the status of an interrupted run.
// For the main thread.
class Delivery {
public:
    explicit Delivery(std::shared_ptr<WriterThread> writer);
    ~Delivery();
    Delivery(const Delivery&) = delete;
    Delivery& operator=(const Delivery&) = delete;

    // Writes the rest of the output and finishes it. Waits for readers without limit; if one
    // interrupt came before the construction, only while they read something each second; after
    // more interrupts, not at all. If it stops waiting, it ends the process with the status of an
    // interrupted run. Throws the output's exceptions.
    void Finish() const;

private:
    const std::shared_ptr<WriterThread> fWriter;
    const int fInterrupts; // before the construction
};

} // namespace assay_host
