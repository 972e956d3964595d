// Reads ahead on a Reader and puts everything back: a look at what comes, without taking it.
//
//     Previewer preview(reader);
//     const std::uint64_t count = preview.ReadSome(magic, sizeof magic);
//     preview.End(); // the reader delivers the same bytes again
//
// While it is active, direct reads of the reader fail. Serves the reader's thread, and must not
// outlive the reader.
#pragma once

#include <cstdint>
#include <memory>

#include "pmutil/Reader.h"

namespace pmutil {

class Previewer {
public:
    // Throws std::runtime_error "Reader: Previewer already active" if one is.
    explicit Previewer(Reader& reader);

    // Ends the preview if End didn't; what can't be put back is lost without a word.
    ~Previewer();
    Previewer(const Previewer&) = delete;
    Previewer& operator=(const Previewer&) = delete;

    // As Reader::ReadSome. Throws std::runtime_error "Previewer: preview ended" after End.
    std::uint64_t ReadSome(void* bytes, std::uint64_t nbytes);

    // Puts back what was read. Throws what Reader::EndPreview throws. A second call does nothing.
    void End();

private:
    Reader& fReader;
    std::unique_ptr<Buffer> fCollected;
};

} // namespace pmutil
