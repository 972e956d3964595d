// Writes a JSON document piece by piece, indented as nlohmann-json's dump. Holds only one piece in
// memory.
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

    // Begins an object with '{' or an array with '['. `name`: its name in the enclosing object;
    // null in an array and for the document itself.
    void Open(char bracket, const char* name = nullptr);

    // Ends the innermost object or array with its closing bracket.
    void Close(char bracket);

    // Writes a member of an object. The name must be valid UTF-8.
    void Write(std::string_view name, const nlohmann::ordered_json& value);

    // Writes an element of an array.
    void Write(const nlohmann::ordered_json& value);

private:
    void BeginItem();
    void BeginLine();
    void WriteName(std::string_view name);
    void WriteValue(const nlohmann::ordered_json& value);

    std::ostream& fOut;
    std::size_t fDepth = 0;
    bool fIsEmpty = true; // nothing is written yet in the innermost object or array
};

} // namespace assay_host
