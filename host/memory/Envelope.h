// The outer form of a file of the state: a format version and a checksum around the content.
//
// A file is a JSON object, one member on a line: "format", "checksum", "content". The checksum is
// the digest of the format's number, a line end, and all bytes after the checksum's line. A later
// version may change the content but not this form, so that every version can tell a newer file
// from a damaged one.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include <nlohmann/json.hpp>

namespace assay_host {

// Incremented when older programs can't read the content any more.
constexpr int kStateFormat = 1;

// Larger files are neither read nor written.
constexpr std::size_t kMaxStateBytes = std::size_t{256} * 1024;

enum class Soundness {
    kSound,
    kDamaged, // not of this form, or the checksum differs
    kNewer    // sound, but of a later format
};

struct Opened {
    Soundness fSoundness = Soundness::kDamaged;
    nlohmann::ordered_json fContent{}; // only of a sound file
};

// Makes the text of a file. All texts of the content must be valid UTF-8.
std::string Seal(const nlohmann::ordered_json& content);

// Reads the text of a file. Never throws for what the text is. Any thread may call.
Opened Unseal(std::string_view text);

// Returns the name for a text: equal for equal texts, different for any others with certainty for
// all practical purposes. 36 lower-case hexadecimal digits and hyphens.
std::string MakeDigest(std::string_view text);

} // namespace assay_host
