#include "report/JsonWriter.h"

#include <nlohmann/json.hpp>

namespace assay_host {

namespace {

constexpr int kIndent = 2;

} // namespace

void JsonWriter::Open(char bracket, const char* name)
{
    BeginItem();
    if (name)
        WriteName(name);
    fOut << bracket;
    ++fDepth;
    fIsEmpty = true;
}

void JsonWriter::Close(char bracket)
{
    --fDepth;
    if (!fIsEmpty)
        BeginLine();
    fOut << bracket;
    fIsEmpty = false;
}

void JsonWriter::Write(std::string_view name, const nlohmann::ordered_json& value)
{
    BeginItem();
    WriteName(name);
    WriteValue(value);
}

void JsonWriter::Write(const nlohmann::ordered_json& value)
{
    BeginItem();
    WriteValue(value);
}

void JsonWriter::BeginItem()
{
    if (fDepth == 0)
        return;
    if (!fIsEmpty)
        fOut << ',';
    BeginLine();
    fIsEmpty = false;
}

void JsonWriter::BeginLine()
{
    fOut << '\n' << std::string(fDepth * kIndent, ' ');
}

void JsonWriter::WriteName(std::string_view name)
{
    fOut << nlohmann::ordered_json(name).dump() << ": ";
}

// Every line end in the text is one of the layout: in strings line ends are escaped.
void JsonWriter::WriteValue(const nlohmann::ordered_json& value)
{
    const std::string text = value.dump(kIndent);
    std::size_t begin = 0;
    for (std::size_t end = text.find('\n'); end != std::string::npos;
         end = text.find('\n', begin)) {
        fOut << std::string_view(text).substr(begin, end - begin);
        BeginLine();
        begin = end + 1;
    }
    fOut << std::string_view(text).substr(begin);
}

} // namespace assay_host
