// What each key of a report means, for people: the texts of `assay-host explain`, which pages show
// too. Any thread may call.
#pragma once

#include <string>

#include "report/KnownKeys.h"

namespace assay_host {

// All texts are constants.
struct Explanation {
    const char* fKey;     // without a tag, as in the table of keys
    const char* fMeaning; // one or more sentences, with what a low or missing value means
    const char* fUnit;    // empty for a text or a flag
    const char* fSource;  // the driver's call, or the list of the system
};

// Returns the key's explanation. Every key of the table has one.
const Explanation& GetExplanation(const KnownKey& key);

} // namespace assay_host
