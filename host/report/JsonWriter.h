// Writes a JSON document piece by piece, indented like a whole dump. Needs memory only for the
// largest piece.
#pragma once

#include <ostream>
#include <string>
#include <string_view>

#include <nlohmann/json_fwd.hpp>

namespace assay_host {

// Doesn't check the stream for failures.
class JsonWriter {
public:
    explicit JsonWriter(std::ostream& out) : fOut(out) {}

    // '{' or '['; the name inside an object, null inside an array and of the document itself.
    void Open(char bracket, const char* name = nullptr);

    // The bracket that closes what was opened last.
    void Close(char bracket);

    // A whole value. The name is valid UTF-8.
    void Write(std::string_view name, const nlohmann::ordered_json& value);
    void Write(const nlohmann::ordered_json& value);

private:
    void BeginItem();
    void BeginLine();
    void WriteName(std::string_view name);
    void WriteValue(const nlohmann::ordered_json& value);

    std::ostream& fOut;
    std::size_t fDepth = 0;
    bool fIsEmpty = true; // what was opened last
};

} // namespace assay_host
