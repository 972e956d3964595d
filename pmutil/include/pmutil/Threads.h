// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Thread names for log lines. The table of names is never destroyed and entries are never removed,
// so a thread whose id is reused has the old name until it is named.
#pragma once

#include <cstdint>
#include <string>

namespace pmutil {

// Sets the name of the calling thread, for log lines and for ShowThreadName.
void SetCurrentThreadName(const std::string& name);

// Returns the calling thread's name, or its id text if it has none.
std::string GetCurrentThreadName();

// Returns MakeThreadIDString of the calling thread's id.
std::string GetCurrentThreadIDString();

// Returns the id in lower-case hexadecimal without a prefix; "{Not-any-thread}" for 0.
std::string MakeThreadIDString(std::uint64_t number);

} // namespace pmutil
