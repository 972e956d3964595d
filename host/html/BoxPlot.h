// A box plot with its samples as a strip of dots, in SVG.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "html/Markup.h"

namespace assay_host {

struct BoxPlot {
    std::string fId;      // of the drawing; unique on the page
    std::string fTitle;   // what the plot is of
    std::string fText;    // what it shows, for readers who don't see it
    std::string fMinText; // the ends of the scale
    std::string fMaxText;
    std::vector<double> fSamples; // at least one, all finite; the box is of these
    std::optional<double> fFirst; // that of the first run, which has a mark of its own
};

// Adds the drawing and its scale. The scale goes from the smallest to the largest value. Of many
// samples only the outliers are drawn as dots.
void AddBoxPlot(Markup& page, const BoxPlot& plot);

} // namespace assay_host
