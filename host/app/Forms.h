// The forms of a run that are written after its end.
#pragma once

#include <ostream>

#include "app/CommandLine.h"
#include "report/StoredRun.h"

namespace assay_host {

// The columns of a text form in a file.
constexpr int kFileWidth = 100;

struct Form {
    Format fFormat = Format::kText; // any but kJsonLines
    int fSchema = 2;                // of kJson
    int fWidth = 80;                // of kText, in columns
};

// Writes the run. Of a series, the forms with one value of each measurement have its median.
// Doesn't check the stream for failures. Any thread may call.
void WriteForm(std::ostream& out, const Form& form, const StoredRun& run);

} // namespace assay_host
