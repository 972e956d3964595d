// The forms of report lines. Values have the default format of streams: plain decimals, bools as 0
// or 1, six significant digits. Texts are written unescaped between double quotes.
#pragma once

#include <sstream>
#include <string>

namespace assay {

// key=value
template <typename Value>
std::string ValueLine(const std::string& key, Value value)
{
    std::ostringstream line;
    line << key << "=" << value;
    return line.str();
}

// key="text"
inline std::string TextLine(const std::string& key, const std::string& text)
{
    std::ostringstream line;
    line << key << "=\"" << text << '"';
    return line.str();
}

// tag.key
inline std::string TaggedKey(std::string tag, const char* key)
{
    return tag.append(".").append(key);
}

// tag.query[name]
inline std::string IndexedKey(std::string tag, const char* query, const char* name)
{
    return tag.append(".").append(query).append("[").append(name).append("]");
}

} // namespace assay
