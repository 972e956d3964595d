// A chart of one measurement of several devices, as rows with a bar in SVG.
#pragma once

#include <string>
#include <vector>

#include "html/Markup.h"

namespace assay_host {

struct Bar {
    std::string fLabel;
    double fValue;     // finite and above 0
    std::string fText; // the value for people
};

// Adds the chart under its title. The bars are in proportion to the values; the longest one has the
// whole width. Must have a bar.
void AddBarChart(Markup& page, const std::string& title, const std::vector<Bar>& bars);

} // namespace assay_host
