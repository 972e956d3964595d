// Observes the calls of drivers and records them, while it lives.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "qgf/DriverCall.h"

namespace assay_test {

// Make only one at a time.
class RecordedCalls : public QGF::Core::DriverCallObserver {
public:
    RecordedCalls() { QGF::Core::ObserveDriverCalls(this); }
    ~RecordedCalls() override { QGF::Core::ObserveDriverCalls(nullptr); }
    RecordedCalls(const RecordedCalls&) = delete;
    RecordedCalls& operator=(const RecordedCalls&) = delete;

    void BeforeCall(QGF::Core::Interface kind) noexcept override { Add("before " + GetName(kind)); }

    void AfterCall(QGF::Core::Interface kind) noexcept override { Add("after " + GetName(kind)); }

    void Add(std::string text) { fCalls.push_back(std::move(text)); }
    const std::vector<std::string>& Get() const { return fCalls; }

private:
    static std::string GetName(QGF::Core::Interface kind)
    {
        return kind == QGF::Core::Interface::kOpenGL ? "OpenGL" : "OpenCL";
    }

    std::vector<std::string> fCalls;
};

} // namespace assay_test
