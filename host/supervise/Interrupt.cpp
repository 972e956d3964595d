#include "supervise/Interrupt.h"

#include <cstdlib>
#include <mutex>
#include <utility>

#include "pmutil/UTF8Console.h"
#include "supervise/InterruptNotes.h"

namespace assay_host {

namespace {

struct Notes {
    std::mutex fMutex;
    std::shared_ptr<pmutil::StopRequest> fStop;
    std::function<void()> fEnd;
    int fCount = 0;
};

Notes& GetNotes()
{
    static Notes& notes = *new Notes; // never deleted: the watching thread outlives statics
    return notes;
}

} // namespace

void NoteInterrupt()
{
    Notes& notes = GetNotes();
    const std::lock_guard<std::mutex> lock(notes.fMutex);
    ++notes.fCount;
    if (notes.fEnd)
        notes.fEnd();
    else if (notes.fStop)
        notes.fStop->Raise();
}

void SetInterruptStop(std::shared_ptr<pmutil::StopRequest> stop)
{
    Notes& notes = GetNotes();
    const std::lock_guard<std::mutex> lock(notes.fMutex);
    notes.fStop = std::move(stop);
}

int SetInterruptEnd(std::function<void()> end)
{
    Notes& notes = GetNotes();
    const std::lock_guard<std::mutex> lock(notes.fMutex);
    notes.fEnd = std::move(end);
    return notes.fCount;
}

void EndProcess(int status)
{
    pmutil::UTF8Console::Restore();
    std::_Exit(status);
}

} // namespace assay_host
