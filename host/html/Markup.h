// Writes elements of an HTML page. One thread at a time.
#pragma once

#include <initializer_list>
#include <ostream>
#include <string>
#include <string_view>
#include <utility>

namespace assay_host {

// Returns the text with the characters escaped that could end it: & < > " '.
std::string EscapeMarkup(std::string_view text);

// Names and values.
using Attributes = std::initializer_list<std::pair<const char*, std::string_view>>;

// Names of elements and attributes are constants of the program and written as they are. All other
// texts are escaped. They must be safe to write to a terminal, as ShowBytes() makes them: a control
// character is no character of a page.
class Markup {
public:
    // Keeps a reference to the stream. Doesn't check it for failures.
    explicit Markup(std::ostream& out) : fOut(out) {}

    // Writes an element with nothing but a text in it.
    void Add(const char* element, std::string_view text, Attributes attributes = {});

    // Writes an element that has no end tag.
    void AddVoid(const char* element, Attributes attributes);

    void AddText(std::string_view text) { fOut << EscapeMarkup(text); }

    // Writes bytes as they are.
    void AddRaw(std::string_view bytes) { fOut << bytes; }

    std::ostream& GetStream() { return fOut; }

private:
    friend class Element;
    void Begin(const char* element, Attributes attributes);
    void End(const char* element);

    std::ostream& fOut;
};

// An element around all that is written while the object exists.
class Element {
public:
    Element(Markup& page, const char* name, Attributes attributes = {}) : fPage(page), fName(name)
    {
        fPage.Begin(name, attributes);
    }
    ~Element() { fPage.End(fName); }
    Element(const Element&) = delete;
    Element& operator=(const Element&) = delete;

private:
    Markup& fPage;
    const char* const fName;
};

} // namespace assay_host
