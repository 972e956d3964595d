// A logger that records lines and enables log statements while it lives.
#pragma once

#include <string>
#include <vector>

#include "pmutil/DebugValues.h"
#include "pmutil/PMLogging.h"

namespace assay_test {

// Lines have no prefix. Make only one at a time. The destructor sets the debug value to 0.
class CapturedLog : public pmutil::PMLogger {
public:
    // Sets `governing`, the debug value of the log statements, to 1.
    explicit CapturedLog(pmutil::DebugValue& governing)
        : PMLogger("CapturedLog"), fGoverning(Started(governing))
    {
        fGoverning = 1;
    }
    ~CapturedLog() override { fGoverning = 0; }

    std::string GetPrefix(const char* /*file*/, int /*line*/) override { return std::string(); }
    void Write(const char* data, std::size_t size) override { fText.append(data, size); }

    // Enables or disables the log statements.
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
