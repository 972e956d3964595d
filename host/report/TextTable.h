// A table of two columns on a terminal: labels, and values that are wrapped.
#pragma once

#include <ostream>
#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

class TextTable {
public:
    // Label and value must be ready for a terminal. An empty value makes the label a heading; an
    // empty label goes on with the row before.
    void Add(std::string label, std::string value);

    bool IsEmpty() const { return fRows.empty(); }

    // Lines are no longer than the width, as far as words, and the labels, allow.
    void Print(std::ostream& out, std::size_t width) const;

private:
    struct Row {
        std::string fLabel;
        std::string fValue;
    };
    std::vector<Row> fRows;
};

// The text in lines of at most `width` characters, broken at blanks where there are any. At least
// one line.
std::vector<std::string> WrapText(std::string_view text, std::size_t width);

} // namespace assay_host
