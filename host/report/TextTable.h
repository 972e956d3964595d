// A table of two columns on a terminal: labels and wrapped values.
#pragma once

#include <ostream>
#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

class TextTable {
public:
    // Adds a row. Both texts must be safe to write to a terminal. A row with an empty value is a
    // heading; a row with an empty label continues the row before.
    void Add(std::string label, std::string value);

    // Prints the rows. Values are wrapped at the width, but get at least 20 columns. Doesn't check
    // the stream for failures.
    void Print(std::ostream& out, std::size_t width) const;

private:
    struct Row {
        std::string fLabel;
        std::string fValue;
    };
    std::vector<Row> fRows;
};

// Splits the text into lines of at most `width` characters, at blanks where possible. Returns at
// least one line. `width` must not be 0.
std::vector<std::string> WrapText(std::string_view text, std::size_t width);

} // namespace assay_host
