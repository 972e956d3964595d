// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Reads ahead on a Reader and then puts the bytes back.
//
//     Previewer preview(reader);
//     const std::uint64_t count = preview.ReadSome(magic, sizeof magic);
//     preview.End(); // the reader delivers the same bytes again
//
// While it is active, direct reads of the reader fail. Use it on the reader's thread; it must not
// outlive the reader.
#pragma once

#include <cstdint>
#include <memory>

#include "pmutil/Reader.h"

namespace pmutil {

class Previewer {
public:
    // Throws std::runtime_error "Reader: Previewer already active" if the reader has one.
    explicit Previewer(Reader& reader);

    // Calls End; bytes that can't be put back are lost silently.
    ~Previewer();
    Previewer(const Previewer&) = delete;
    Previewer& operator=(const Previewer&) = delete;

    // Like Reader::ReadSome. Throws std::runtime_error "Previewer: preview ended" after End.
    std::uint64_t ReadSome(void* bytes, std::uint64_t nbytes);

    // Puts back the bytes read. Throws what Reader::EndPreview throws. A second call does nothing.
    void End();

private:
    Reader& fReader;
    std::unique_ptr<Buffer> fCollected;
};

} // namespace pmutil
