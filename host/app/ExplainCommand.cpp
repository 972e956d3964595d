#include <cstddef>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <boost/algorithm/string/predicate.hpp>
#include <fmt/format.h>

#include "app/Commands.h"
#include "output/Output.h"
#include "output/Terminal.h"
#include "report/Bytes.h"
#include "report/Explanations.h"
#include "report/KnownKeys.h"
#include "report/LineForm.h"
#include "report/SimilarName.h"
#include "report/TextTable.h"

namespace assay_host {

namespace {

// Returns the name in brackets at the key's end without its namespace: "GL_MAX_DRAW_BUFFERS" of
// "glGetIntegerv[GL_MAX_DRAW_BUFFERS]"; empty without brackets.
std::string_view GetInnerName(std::string_view key)
{
    const std::size_t open = key.rfind('[');
    if (open == std::string_view::npos)
        return {};
    std::string_view name = key.substr(open + 1, key.size() - open - 2);
    const std::size_t colons = name.rfind("::");
    return colons == std::string_view::npos ? name : name.substr(colons + 2);
}

// Removes a device's tag or "gputag." from the front.
std::string_view RemoveTag(std::string_view text)
{
    constexpr std::string_view kCodes = "gputag.";
    if (text.substr(0, kCodes.size()) == kCodes)
        return text.substr(kCodes.size());
    const auto tag = GetDeviceTag(text);
    return tag ? text.substr(tag->size() + 1) : text;
}

bool IsCalled(const KnownKey& key, std::string_view name)
{
    const std::string_view own = key.fKey;
    const std::string_view inner = GetInnerName(own);
    const std::string_view withoutSpace = name.substr(name.rfind(':') + 1);
    return boost::algorithm::iequals(own, name) ||
           (!inner.empty() && boost::algorithm::iequals(inner, withoutSpace)) ||
           (!key.fLabel.empty() && boost::algorithm::iequals(key.fLabel, name));
}

std::vector<const KnownKey*> FindKeys(const std::string& text)
{
    std::vector<const KnownKey*> found;
    for (const KnownKey& key : GetKnownKeys())
        if (IsCalled(key, RemoveTag(text)))
            found.push_back(&key);
    if (!found.empty())
        return found;
    std::vector<std::string> names;
    for (const KnownKey& key : GetKnownKeys()) {
        names.push_back(key.fKey);
        names.emplace_back(GetInnerName(key.fKey));
        names.push_back(key.fLabel);
    }
    const std::string similar = FindSimilarName(RemoveTag(text), names);
    throw std::runtime_error(fmt::format("\"{}\" is no key of a report{}", ShowBytes(text),
                                         similar.empty()
                                             ? "; \"assay-host explain\" lists them"
                                             : fmt::format("; did you mean \"{}\"?", similar)));
}

void Explain(std::ostream& out, const KnownKey& key, std::size_t width)
{
    const Explanation& explanation = GetExplanation(key);
    out << key.fKey << (key.fLabel.empty() ? "" : ": " + key.fLabel) << "\n";
    TextTable table;
    table.Add("Meaning", explanation.fMeaning);
    if (*explanation.fUnit != '\0')
        table.Add("Unit", explanation.fUnit);
    table.Add("Source", explanation.fSource);
    table.Print(out, width);
}

void List(std::ostream& out)
{
    for (const KnownKey& key : GetKnownKeys())
        out << fmt::format(key.fLabel.empty() ? "{}\n" : "{} ({})\n", key.fKey, key.fLabel);
}

} // namespace

int Explain(const ExplainChoice& choice)
{
    std::ostringstream out;
    const auto width = static_cast<std::size_t>(GetOutputWidth());
    if (choice.fKeys.empty())
        List(out);
    const char* separator = "";
    for (const std::string& text : choice.fKeys) {
        for (const KnownKey* const key : FindKeys(text)) {
            out << separator;
            Explain(out, *key, width);
            separator = "\n";
        }
    }
    OpenStandardOutput()->Write(out.str());
    return 0;
}

} // namespace assay_host
