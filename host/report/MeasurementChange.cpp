#include "report/MeasurementChange.h"

#include <algorithm>
#include <cmath>
#include <optional>

#include <fmt/format.h>

#include "report/Numbers.h"

namespace assay_host {

namespace {

// Returns a text such as "-51 %", or an empty one if a value can't be trusted.
std::string GetPercentText(const Answer& before, const Answer& after, double from, double to)
{
    if (!before.IsKnown() || !after.IsKnown())
        return {};
    return fmt::format("{:+.3g} %", (to / from - 1) * 100);
}

} // namespace

MeasurementChange CompareMeasurements(const Answer& before, const Answer& after,
                                      const MeasurementRule& rule)
{
    if (before.fLine->fQuoted == after.fLine->fQuoted &&
        before.fLine->fValue == after.fLine->fValue)
        return {};
    const std::optional<double> from = ReadDouble(before.fLine->fValue);
    const std::optional<double> to = ReadDouble(after.fLine->fValue);
    if (!from || !to)
        return {true, {}};
    if (rule.fFasterIsSame && after.IsKnown() && *to >= *from)
        return {};
    if (std::abs(*from - *to) <= rule.fTolerance * std::max(std::abs(*from), std::abs(*to)))
        return {};
    return {true, GetPercentText(before, after, *from, *to)};
}

} // namespace assay_host
