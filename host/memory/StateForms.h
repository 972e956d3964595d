// The lines of `assay-host state` for people. All texts are safe to write to a terminal. Any thread
// may call.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "memory/Choice.h"
#include "memory/Store.h"

namespace assay_host {

// Returns a line for each entry, with what it says at this time, and the user's choice.
std::string MakeStateList(const std::vector<StoredKnowledge>& entries, const Choice& choice,
                          std::int64_t now);

// Returns all that is known of an entry.
std::string MakeStateText(const StoredKnowledge& entry);

} // namespace assay_host
