// What the test child's "args" writes: each argument in hexadecimal on a line.
#pragma once

#include <sstream>
#include <string>
#include <vector>

namespace pmutil {

inline std::vector<std::string> DecodeHexLines(const std::string& hexadecimal)
{
    std::vector<std::string> result;
    std::istringstream lines(hexadecimal);
    for (std::string line; std::getline(lines, line);) {
        std::string text;
        for (std::size_t at = 0; at + 1 < line.size(); at += 2)
            text += static_cast<char>(std::stoi(line.substr(at, 2), nullptr, 16));
        result.push_back(text);
    }
    return result;
}

inline std::string EncodeHexLines(const std::vector<std::string>& texts)
{
    static const char kDigits[] = "0123456789abcdef";
    std::string lines;
    for (const std::string& text : texts) {
        for (const char byte : text) {
            const auto value = static_cast<unsigned char>(byte);
            lines += {kDigits[value / 16], kDigits[value % 16]};
        }
        lines += '\n';
    }
    return lines;
}

} // namespace pmutil
