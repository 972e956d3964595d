// The result object of the C interface.
#pragma once

#include <cstddef>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

#include "assay_host.h"
#include "report/Answers.h"
#include "report/Report.h"
#include "report/RunFacts.h"
#include "report/RunOutcome.h"
#include "report/Usable.h"
#include "report/Warnings.h"

struct assay_host_device {
    const assay_host::DeviceAnswers* fDevice;
    int fSoftware; // as assay_host_device_software returns it
};

struct assay_host_answer {
    const assay_host::Answer* fAnswer = nullptr;
    std::string fKey; // with the tag
    assay_host_kind fKind = ASSAY_HOST_NOTHING;
    double fNumber = 0;
    std::vector<double> fList;
    int fFlag = -1;
};

// Constant after construction, except for the document.
struct assay_host_result {
    assay_host_result(assay_host::Report report, assay_host::RunOutcome outcome,
                      assay_host::RunFacts facts);
    assay_host_result(const assay_host_result&) = delete;
    assay_host_result& operator=(const assay_host_result&) = delete;

    const std::string& GetDocument() const; // any thread may call

    const assay_host::Report fReport;
    const assay_host::RunOutcome fOutcome;
    const assay_host::RunFacts fFacts;
    const assay_host::Answers fAnswers; // points into fReport
    const std::string fReason;          // as shown to a user
    const assay_host::Usable fUsable[2];
    const std::vector<assay_host::Warning> fWarnings;
    std::vector<assay_host_device> fDevices;
    std::vector<assay_host_answer> fAllAnswers;
    std::unordered_map<std::string, std::size_t> fByKey; // index in fAllAnswers

private:
    void Add(const std::string& tag, const assay_host::Answer& answer);

    mutable std::mutex fMutex;
    mutable std::optional<std::string> fDocument;
};
