// A logger that keeps what is logged while it lives, and turns the program's log statements on.
#pragma once

#include <string>
#include <vector>

#include "pmutil/DebugValues.h"
#include "pmutil/PMLogging.h"

namespace assay_test {

// Lines come without a prefix. Only one at a time; the debug value is 0 again at its end.
class CapturedLog : public pmutil::PMLogger {
public:
    explicit CapturedLog(pmutil::DebugValue& governing)
        : PMLogger("CapturedLog"), fGoverning(Started(governing))
    {
        fGoverning = 1;
    }
    ~CapturedLog() override { fGoverning = 0; }

    std::string GetPrefix(const char* /*file*/, int /*line*/) override { return std::string(); }
    void Write(const char* data, std::size_t size) override { fText.append(data, size); }

    // Whether statements log at all.
    void SetOn(bool on) { fGoverning = on ? 1 : 0; }

    const std::string& Text() const { return fText; }

    std::vector<std::string> Lines() const
    {
        std::vector<std::string> lines;
        std::size_t begin = 0;
        for (std::size_t end = fText.find('\n'); end != std::string::npos;
             end = fText.find('\n', begin)) {
            lines.push_back(fText.substr(begin, end - begin));
            begin = end + 1;
        }
        if (begin != fText.size())
            lines.push_back(fText.substr(begin));
        return lines;
    }

private:
    static pmutil::DebugInteger& Started(pmutil::DebugValue& governing)
    {
        pmutil::InitLogging();
        return pmutil::GetDebugValue(governing);
    }

    pmutil::DebugInteger& fGoverning;
    std::string fText;
};

} // namespace assay_test
