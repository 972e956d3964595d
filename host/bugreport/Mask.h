// Replaces what names a person or a machine in the texts of a bug report.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "identity/Identity.h"
#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"

namespace assay_host {

// What must not be seen, and what is shown instead: "HOST", "USER" or "HOME".
struct Secret {
    std::string fText;
    std::string fWord;
};

// Returns the machine's names, the names of the user (also of one who called sudo), and the paths
// of the home folders, as the system and the environment have them. Some may be empty. Throws only
// std::bad_alloc. Any thread may call while no other thread changes the environment.
std::vector<Secret> ListSecrets();

// Any thread may call its functions at the same time.
class Mask {
public:
    // Secrets that name nobody are ignored: an empty text, "root", "localhost", the root folder.
    explicit Mask(const std::vector<Secret>& secrets);

    // Replaces each secret that is no part of a longer word. The case of letters from A to Z and
    // the kind of slash don't matter.
    std::string Apply(std::string_view text) const;

    // The same in all texts of a run.
    void ApplyTo(Report& report) const;
    void ApplyTo(RunOutcome& outcome) const;
    void ApplyTo(RunFacts& facts) const;
    void ApplyTo(Identity& identity) const;

private:
    void ApplyTo(std::string& text) const;
    void ApplyTo(Fact& fact) const;
    void ApplyTo(std::vector<std::string>& texts) const;
    const Secret* FindAt(std::string_view text, std::size_t at) const;

    std::vector<Secret> fSecrets; // the longest first
};

} // namespace assay_host
