// Any bytes as the text of a JSON string.
//
// JSON is Unicode, and a driver's bytes need not be. A byte that isn't part of well-formed UTF-8 is
// written as the character 0xF700 plus the byte, in the private range U+F780 to U+F7FF. The bytes
// of a real character of that range are written the same way, so that decoding is exact.
//
// Any thread may call.
#pragma once

#include <string>

namespace assay_host {

// Encodes any bytes as UTF-8 for a JSON string.
std::string EncodeBytes(const std::string& bytes);

// Decodes a text of EncodeBytes.
std::string DecodeBytes(const std::string& text);

} // namespace assay_host
