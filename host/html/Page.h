// What every page has around its content: the head with its policy and style, the footer, and the
// document that its button copies.
#pragma once

#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include "html/Markup.h"

namespace assay_host {

// Writes a page. `addContent` adds the elements "header" and "main"; `writeDocument` writes JSON.
// The page needs nothing but itself: no script to be read, nothing from a network. Its content
// security policy allows its own style, and the one script that copies the document. Doesn't check
// the stream for failures.
void WritePage(Markup& page, const std::string& title, const std::function<void()>& addContent,
               const std::function<void(std::ostream&)>& writeDocument);

// Adds a heading and a list; nothing without items.
void AddList(Markup& page, const char* heading, const char* title,
             const std::vector<std::string>& items);

} // namespace assay_host
