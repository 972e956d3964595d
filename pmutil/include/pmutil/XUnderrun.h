// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Thrown for a transfer of fewer bytes than requested.
#pragma once

#include <cstdint>
#include <stdexcept>
#include <vector>

namespace pmutil {

// The message is "I/O underrun, actual count=" and the count.
class XUnderrun : public std::runtime_error {
public:
    // `count` bytes were transferred. If `bytes` isn't null, they are copied from there.
    explicit XUnderrun(std::uint64_t count, const void* bytes = nullptr);
    ~XUnderrun() override;

    bool HasData() const { return fHasData; }
    std::uint64_t GetCount() const { return fCount; }
    const std::vector<unsigned char>& GetData() const { return fData; }

private:
    bool fHasData;
    std::uint64_t fCount;
    std::vector<unsigned char> fData;
};

} // namespace pmutil
