#include "html/Page.h"

#include <algorithm>
#include <streambuf>
#include <string_view>

#include <fmt/format.h>

#include "html/Assets.h"

namespace assay_host {

namespace {

// Passes JSON on in a form that can't end the element around it: "<" only occurs in its strings.
class ScriptBuffer : public std::streambuf {
public:
    explicit ScriptBuffer(std::ostream& out) : fOut(out) {}

protected:
    int_type overflow(int_type character) override
    {
        if (traits_type::eq_int_type(character, traits_type::eof()))
            return traits_type::not_eof(character);
        const char byte = traits_type::to_char_type(character);
        return xsputn(&byte, 1) == 1 ? character : traits_type::eof();
    }

    std::streamsize xsputn(const char* bytes, std::streamsize count) override
    {
        std::string_view rest(bytes, static_cast<std::size_t>(count));
        while (!rest.empty()) {
            const std::size_t at = std::min(rest.find('<'), rest.size());
            fOut << rest.substr(0, at);
            if (at < rest.size())
                fOut << "\\u003C";
            rest.remove_prefix(std::min(at + 1, rest.size()));
        }
        return count;
    }

private:
    std::ostream& fOut;
};

void AddHead(Markup& page, const std::string& title)
{
    const Element head(page, "head");
    page.AddVoid("meta", {{"charset", "utf-8"}});
    page.AddVoid("meta", {{"http-equiv", "Content-Security-Policy"},
                          {"content",
                           fmt::format("default-src 'none'; style-src 'unsafe-inline'; script-src "
                                       "'{}'; base-uri 'none'; form-action 'none'",
                                       kCopyScriptHash)}});
    page.AddVoid("meta",
                 {{"name", "viewport"}, {"content", "width=device-width, initial-scale=1"}});
    page.Add("title", title);
    const Element style(page, "style");
    page.AddRaw(kPageStyle);
}

void AddFooter(Markup& page)
{
    const Element footer(page, "footer");
    const Element line(page, "p", {{"class", "soft"}});
    page.AddText("Made by assay-host. ");
    page.Add("button", "Copy as JSON", {{"id", "copy"}, {"hidden", ""}});
    page.Add("span", "", {{"id", "copied"}, {"role", "status"}});
}

void AddDocument(Markup& page, const std::function<void(std::ostream&)>& writeDocument)
{
    {
        const Element json(page, "script", {{"type", "application/json"}, {"id", "json"}});
        ScriptBuffer buffer(page.GetStream());
        std::ostream document(&buffer);
        writeDocument(document);
    }
    const Element script(page, "script");
    page.AddRaw(kCopyScript);
}

} // namespace

void WritePage(Markup& page, const std::string& title, const std::function<void()>& addContent,
               const std::function<void(std::ostream&)>& writeDocument)
{
    page.AddRaw("<!DOCTYPE html>\n");
    const Element html(page, "html", {{"lang", "en"}});
    AddHead(page, title);
    const Element body(page, "body");
    addContent();
    AddFooter(page);
    // After all else, so that a reader waits for nothing.
    AddDocument(page, writeDocument);
}

void AddList(Markup& page, const char* heading, const char* title,
             const std::vector<std::string>& items)
{
    if (items.empty())
        return;
    page.Add(heading, title);
    const Element list(page, "ul");
    for (const std::string& item : items)
        page.Add("li", item);
}

} // namespace assay_host
