// Records the failures that requirement checks report; they don't go to standard error.
#pragma once

#include <string>
#include <vector>

#include "pmutil/Requirement.h"

namespace assay_test {

class CapturedFailures {
public:
    CapturedFailures() : fPrevious(pmutil::SetFailureHandler(Handle)) { Texts().clear(); }
    ~CapturedFailures() { pmutil::SetFailureHandler(fPrevious); }
    CapturedFailures(const CapturedFailures&) = delete;
    CapturedFailures& operator=(const CapturedFailures&) = delete;

    const std::vector<std::string>& texts() const { return Texts(); }

private:
    static std::vector<std::string>& Texts()
    {
        static std::vector<std::string> texts;
        return texts;
    }
    static void Handle(const char* text) { Texts().emplace_back(text); }

    pmutil::FailureHandler fPrevious;
};

} // namespace assay_test
