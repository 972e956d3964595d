#include "html/Markup.h"

namespace assay_host {

std::string EscapeMarkup(std::string_view text)
{
    std::string escaped;
    for (const char character : text) {
        switch (character) {
        case '&':
            escaped += "&amp;";
            break;
        case '<':
            escaped += "&lt;";
            break;
        case '>':
            escaped += "&gt;";
            break;
        case '"':
            escaped += "&quot;";
            break;
        case '\'':
            escaped += "&#39;";
            break;
        default:
            escaped += character;
        }
    }
    return escaped;
}

void Markup::Begin(const char* element, Attributes attributes)
{
    fOut << '<' << element;
    for (const auto& [name, value] : attributes)
        fOut << ' ' << name << "=\"" << EscapeMarkup(value) << '"';
    fOut << '>';
}

void Markup::End(const char* element)
{
    fOut << "</" << element << '>';
    // A line end beside an element within a line would be a blank.
    if (std::string_view(element) != "span")
        fOut << '\n';
}

void Markup::Add(const char* element, std::string_view text, Attributes attributes)
{
    Begin(element, attributes);
    AddText(text);
    End(element);
}

void Markup::AddVoid(const char* element, Attributes attributes)
{
    Begin(element, attributes);
    fOut << '\n';
}

} // namespace assay_host
