// Runs of the test child by the C interface.
#pragma once

#include <chrono>
#include <cstdlib>
#include <functional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <assay_host.h>

#include "TestChild.h"
#include "support/OpenThings.h"

using Words = std::vector<std::string>;

const Words kWhole = {"out", "assayStart=\"x\"", "out", "assayEnd=\"y\""};

inline Words operator+(Words left, const Words& right)
{
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

// Returns any number as one of an enumeration, as a program in C or of a later version has it.
template <typename Enumeration>
Enumeration MakeNumber(int number)
{
    return static_cast<Enumeration>(number);
}

class Options {
public:
    using TakeLine = std::function<int(const std::string& line)>;

    Options()
    {
        assay_host_options_set_program(fOptions, TEST_CHILD);
        assay_host_options_set_timeout(fOptions, 300);
    }
    ~Options() { assay_host_options_free(fOptions); }
    Options(const Options&) = delete;
    Options& operator=(const Options&) = delete;

    operator assay_host_options*() const { return fOptions; }

    void OnLine(TakeLine take)
    {
        fTakeLine = std::move(take);
        assay_host_options_on_line(fOptions, Call, &fTakeLine);
    }
    void OnErrorLine(TakeLine take)
    {
        fTakeErrorLine = std::move(take);
        assay_host_options_on_error_line(fOptions, Call, &fTakeErrorLine);
    }

private:
    static int Call(void* context, const char* line, std::size_t size, double /*seconds*/)
    {
        return (*static_cast<TakeLine*>(context))({line, size});
    }

    assay_host_options* const fOptions = assay_host_options_new();
    TakeLine fTakeLine;
    TakeLine fTakeErrorLine;
};

// A run of the test child with these words.
struct ChildRun {
    explicit ChildRun(const Words& words, const Options& options = {},
                      assay_host_stop* stop = nullptr)
    {
        for (const std::string& word : words)
            assay_host_options_add_argument(options, word.c_str());
        fError = assay_host_run(options, stop, &fResult);
    }
    ~ChildRun() { assay_host_result_free(fResult); }
    ChildRun(const ChildRun&) = delete;
    ChildRun& operator=(const ChildRun&) = delete;

    assay_host_verdict GetVerdict() const { return assay_host_result_verdict(fResult); }

    assay_host_error fError = ASSAY_HOST_INTERNAL;
    assay_host_result* fResult = nullptr;
};

// The objects of this process: threads, descriptors or handles, child processes.
using Counts = std::vector<long>;
constexpr std::size_t kOpenThings = 1; // the index of descriptors or handles
Counts CountThings();

// Waits until there are no more than before the runs: a thread is listed for a moment after it was
// joined. Returns the counts, which differ from those before only if something is left.
inline Counts CountAfter(long runs, const Counts& before)
{
    Counts most = before;
    most[kOpenThings] += GetMaxGrowth(runs);
    Counts after = CountThings();
    for (int tries = 0; tries < 5000; ++tries) {
        bool isMore = false;
        for (std::size_t index = 0; index < after.size(); ++index)
            isMore = isMore || after[index] > most[index];
        if (!isMore)
            return before;
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
        after = CountThings();
    }
    return after;
}

// The memory that this process has and doesn't share with files.
long GetMemoryKiB();
