// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A C++17 wrapper of libassay-host with value types. Header-only: the binary interface is that of
// assay_host.h.
//
// A failed call throws std::bad_alloc, std::invalid_argument or std::runtime_error with the error's
// text.
#ifndef ASSAY_HOST_HPP
#define ASSAY_HOST_HPP

#include <cstddef>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <new>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

#include "assay_host.h"

namespace assay {

enum class Verdict {
    complete = ASSAY_HOST_COMPLETE,
    failed_tests = ASSAY_HOST_FAILED_TESTS,
    usage_error = ASSAY_HOST_USAGE_ERROR,
    crashed = ASSAY_HOST_CRASHED,
    hung = ASSAY_HOST_HUNG,
    never_started = ASSAY_HOST_NEVER_STARTED,
    interrupted = ASSAY_HOST_INTERRUPTED
};

enum class Interface { opengl = ASSAY_HOST_OPENGL, opencl = ASSAY_HOST_OPENCL };

enum class Usability {
    hardware = ASSAY_HOST_HARDWARE,
    software = ASSAY_HOST_SOFTWARE,
    broken = ASSAY_HOST_BROKEN,
    absent = ASSAY_HOST_ABSENT,
    unknown = ASSAY_HOST_UNKNOWN
};

enum class Plan { answer = ASSAY_HOST_ANSWER, attempt = ASSAY_HOST_TRY, wait = ASSAY_HOST_WAIT };

enum class Choice {
    automatic = ASSAY_HOST_CHOICE_AUTO,
    hardware = ASSAY_HOST_CHOICE_HARDWARE,
    software = ASSAY_HOST_CHOICE_SOFTWARE,
    absent = ASSAY_HOST_CHOICE_ABSENT
};

// The version of the library, "1.0.0".
inline std::string version()
{
    return assay_host_version();
}

inline std::string to_string(Verdict verdict)
{
    return assay_host_verdict_name(static_cast<assay_host_verdict>(verdict));
}

inline std::string to_string(Usability usability)
{
    return assay_host_usability_name(static_cast<assay_host_usability>(usability));
}

inline std::string to_string(Plan plan)
{
    return assay_host_plan_name(static_cast<assay_host_plan>(plan));
}

// Whether an interface can be used, and why.
struct Usable {
    Usability usability = Usability::unknown;
    std::string reason; // a stable identifier
    std::string text;   // for the user
    std::string device; // its tag; empty for none
};

struct Warning {
    std::string code;   // a stable identifier
    std::string device; // its tag; empty for the whole run
    std::string text;   // for the user
    std::string cause;  // from the child's log; may be empty
};

struct Device {
    std::string tag; // "glgpu[0]"
    Interface interface_kind = Interface::opengl;
    bool complete = false;
    bool failed = false;
    std::optional<bool> software; // empty if its answers don't show it
};

// The answer to a key: a text, a number, a list of numbers, or nothing and the reason.
struct Answer {
    std::string key;
    std::variant<std::monostate, std::string, double, std::vector<double>> value;
    std::optional<bool> flag; // of a number that means yes or no
    std::string text;         // as the report has it
    std::string reason;       // why there is nothing

    explicit operator bool() const { return value.index() != 0; }
};

// What an advice says of an interface.
struct Advised {
    Usability usability = Usability::unknown;
    std::string reason;                    // a stable identifier
    std::string text;                      // for the user
    std::string source;                    // "attempt", "memory", "choice" or "none"
    Usability learnt = Usability::unknown; // without the user's choice
    std::string device;                    // its tag, name and driver; empty if unknown
    std::string device_name;
    std::string device_driver;
    std::string end; // of the attempt: a stable identifier, and for the user; may be empty
    std::string end_text;
    std::string last_line;                      // of the child, if it brought no usable device
    std::optional<double> age_seconds;          // of the attempt or of the choice
    std::uint64_t failures = 0;                 // that count, since the last success
    std::optional<double> next_attempt_seconds; // from the advice; empty: at the next call
    std::string change;                         // what would change the answer
    std::string warning;                        // may be empty
};

// What decides when advise() makes another attempt. The times are seconds.
struct Policy {
    double max_age = 30 * 24 * 3600.0;        // hardware and software are tried again after this
    double keep_absent = 600;                 // absent is
    double keep_unknown = 60;                 // unknown is, if a child ended by itself
    double pause = 60;                        // before the second attempt after a failure
    unsigned pause_growth = 60;               // each further pause is longer by this factor
    unsigned retries = 2;                     // attempts after a first failure
    double forgive = 7 * 24 * 3600.0;         // failures that are older don't count
    double forgive_freeze = 30 * 24 * 3600.0; // ends of the system that are older don't count
    unsigned unclear = 3;                     // attempts in a row that may show nothing
    double unclear_pause = 600;               // before the next attempt after so many
};

// The callbacks are called on the thread of run() or advise(). One that returns false ends the run;
// one that throws ends it too, and run() or advise() throws that exception.
struct Options {
    std::string program; // empty: the one beside the library
    std::vector<std::string> arguments;
    double timeout_seconds = 60; // 0: no limit
    std::uint64_t max_bytes = 0; // 0: the default
    std::uint64_t max_line_bytes = 0;
    std::uint64_t max_lines = 0;
    bool identify = false;
    std::function<bool(std::string_view line, double seconds)> on_line;
    std::function<bool(std::string_view line, double seconds)> on_error_line;
    std::function<bool(double seconds, std::uint64_t steps, std::string_view next_key)> on_tick;

    // For advise() alone.
    bool need_opengl = true; // what may cause an attempt
    bool need_opencl = false;
    bool fresh = false;       // results are due at any age
    bool dry_run = false;     // only show what a call would do
    double wait_seconds = 10; // for the attempt of another process or thread
    Policy policy;
};

namespace detail {

inline void check(assay_host_error error)
{
    switch (error) {
    case ASSAY_HOST_OK:
        return;
    case ASSAY_HOST_NO_MEMORY:
        throw std::bad_alloc();
    case ASSAY_HOST_NULL_POINTER:
    case ASSAY_HOST_BAD_VALUE:
    case ASSAY_HOST_BAD_TEXT:
        throw std::invalid_argument(assay_host_error_text(error));
    default:
        throw std::runtime_error(assay_host_error_text(error));
    }
}

template <typename Object>
Object* check_made(Object* object)
{
    if (object == nullptr)
        throw std::bad_alloc();
    return object;
}

struct Free {
    void operator()(assay_host_options* object) const { assay_host_options_free(object); }
    void operator()(assay_host_stop* object) const { assay_host_stop_free(object); }
    void operator()(assay_host_result* object) const { assay_host_result_free(object); }
    void operator()(assay_host_advice* object) const { assay_host_advice_free(object); }
    void operator()(assay_host_state* object) const { assay_host_state_free(object); }
};

// The callbacks of one run, and the exception of one.
struct Calls {
    const Options& options;
    std::exception_ptr failure;

    template <typename Call>
    int call(const Call& action) noexcept
    {
        try {
            return action() ? 0 : 1;
        } catch (...) {
            failure = std::current_exception();
            return 1;
        }
    }

    static int take_line(void* context, const char* line, std::size_t size, double seconds)
    {
        auto& calls = *static_cast<Calls*>(context);
        return calls.call([&] { return calls.options.on_line({line, size}, seconds); });
    }

    static int take_error_line(void* context, const char* line, std::size_t size, double seconds)
    {
        auto& calls = *static_cast<Calls*>(context);
        return calls.call([&] { return calls.options.on_error_line({line, size}, seconds); });
    }

    static int take_tick(void* context, double seconds, std::uint64_t steps, const char* next_key)
    {
        auto& calls = *static_cast<Calls*>(context);
        return calls.call([&] { return calls.options.on_tick(seconds, steps, next_key); });
    }
};

using OptionsHandle = std::unique_ptr<assay_host_options, Free>;

// `calls` must outlive the handle.
inline OptionsHandle make_options(Calls& calls)
{
    const Options& options = calls.options;
    OptionsHandle made(check_made(assay_host_options_new()));
    assay_host_options* const handle = made.get();
    if (!options.program.empty())
        check(assay_host_options_set_program(handle, options.program.c_str()));
    for (const std::string& argument : options.arguments)
        check(assay_host_options_add_argument(handle, argument.c_str()));
    check(assay_host_options_set_timeout(handle, options.timeout_seconds));
    if (options.max_bytes != 0)
        check(assay_host_options_set_max_bytes(handle, options.max_bytes));
    if (options.max_line_bytes != 0)
        check(assay_host_options_set_max_line_bytes(handle, options.max_line_bytes));
    if (options.max_lines != 0)
        check(assay_host_options_set_max_lines(handle, options.max_lines));
    check(assay_host_options_set_identify(handle, options.identify ? 1 : 0));
    if (options.on_line)
        check(assay_host_options_on_line(handle, Calls::take_line, &calls));
    if (options.on_error_line)
        check(assay_host_options_on_error_line(handle, Calls::take_error_line, &calls));
    if (options.on_tick)
        check(assay_host_options_on_tick(handle, Calls::take_tick, &calls));
    return made;
}

inline void set_advice_options(assay_host_options* handle, const Options& options)
{
    check(assay_host_options_set_need(handle, options.need_opengl ? 1 : 0,
                                      options.need_opencl ? 1 : 0));
    check(assay_host_options_set_fresh(handle, options.fresh ? 1 : 0));
    check(assay_host_options_set_dry_run(handle, options.dry_run ? 1 : 0));
    check(assay_host_options_set_wait(handle, options.wait_seconds));
    const Policy& policy = options.policy;
    for (const auto& [which, value] :
         {std::pair<assay_host_policy, double>(ASSAY_HOST_MAX_AGE, policy.max_age),
          {ASSAY_HOST_KEEP_ABSENT, policy.keep_absent},
          {ASSAY_HOST_KEEP_UNKNOWN, policy.keep_unknown},
          {ASSAY_HOST_PAUSE, policy.pause},
          {ASSAY_HOST_PAUSE_GROWTH, policy.pause_growth},
          {ASSAY_HOST_RETRIES, policy.retries},
          {ASSAY_HOST_FORGIVE, policy.forgive},
          {ASSAY_HOST_FORGIVE_FREEZE, policy.forgive_freeze},
          {ASSAY_HOST_UNCLEAR, policy.unclear},
          {ASSAY_HOST_UNCLEAR_PAUSE, policy.unclear_pause}})
        check(assay_host_options_set_policy(handle, which, value));
}

} // namespace detail

// Ends runs and advices from any thread. Can't be withdrawn. Must outlive them.
class Stop {
public:
    Stop() : fStop(detail::check_made(assay_host_stop_new())) {}
    void raise() { detail::check(assay_host_stop_raise(fStop.get())); }
    assay_host_stop* get() const { return fStop.get(); }

private:
    std::unique_ptr<assay_host_stop, detail::Free> fStop;
};

// What a run has brought. Copies share it, and any thread may read it.
class Result {
public:
    // Takes the ownership.
    explicit Result(assay_host_result* result) : fResult(result, detail::Free()) {}

    Verdict verdict() const
    {
        return static_cast<Verdict>(assay_host_result_verdict(fResult.get()));
    }
    std::string reason() const { return assay_host_result_reason(fResult.get()); }
    std::string termination() const { return assay_host_result_termination(fResult.get()); }
    double seconds() const { return assay_host_result_seconds(fResult.get()); }
    // Whether a process of the child could not be killed and may still run.
    bool left_behind() const { return assay_host_result_left_behind(fResult.get()) != 0; }

    // The last line of the report, and the last line of the child's log after it, which shows what
    // the child was doing. Empty if there is none.
    std::string last_line() const { return read(assay_host_result_last_line); }
    std::string last_log_line() const { return read(assay_host_result_last_log_line); }

    // The bytes that the limits dropped of the report and of standard error.
    std::uint64_t lost_bytes() const { return assay_host_result_lost_bytes(fResult.get()); }
    std::uint64_t lost_error_bytes() const
    {
        return assay_host_result_lost_error_bytes(fResult.get());
    }

    std::optional<int> exit_status() const
    {
        int status = 0;
        if (assay_host_result_exit_status(fResult.get(), &status) == 0)
            return std::nullopt;
        return status;
    }

    std::vector<std::string> error_lines() const
    {
        std::vector<std::string> lines;
        const std::size_t count = assay_host_result_error_line_count(fResult.get());
        for (std::size_t index = 0; index < count; ++index) {
            std::size_t size = 0;
            const char* const line = assay_host_result_error_line(fResult.get(), index, &size);
            lines.emplace_back(line, size);
        }
        return lines;
    }

    Usable usable(Interface which) const
    {
        const auto number = static_cast<assay_host_interface>(which);
        return {static_cast<Usability>(assay_host_result_usable(fResult.get(), number)),
                assay_host_result_usable_reason(fResult.get(), number),
                assay_host_result_usable_text(fResult.get(), number),
                assay_host_result_usable_device(fResult.get(), number)};
    }

    std::vector<Warning> warnings() const
    {
        std::vector<Warning> warnings;
        const std::size_t count = assay_host_result_warning_count(fResult.get());
        for (std::size_t index = 0; index < count; ++index)
            warnings.push_back({assay_host_result_warning_code(fResult.get(), index),
                                assay_host_result_warning_device(fResult.get(), index),
                                assay_host_result_warning_text(fResult.get(), index),
                                assay_host_result_warning_cause(fResult.get(), index)});
        return warnings;
    }

    std::vector<Device> devices() const
    {
        std::vector<Device> devices;
        const std::size_t count = assay_host_result_device_count(fResult.get());
        for (std::size_t index = 0; index < count; ++index) {
            const assay_host_device* const device = assay_host_result_device(fResult.get(), index);
            Device made;
            made.tag = assay_host_device_tag(device);
            made.interface_kind = static_cast<Interface>(assay_host_device_interface(device));
            made.complete = assay_host_device_complete(device) != 0;
            made.failed = assay_host_device_failed(device) != 0;
            const int software = assay_host_device_software(device);
            if (software >= 0)
                made.software = software != 0;
            devices.push_back(made);
        }
        return devices;
    }

    Answer find(const std::string& key) const
    {
        Answer answer = make(assay_host_result_find(fResult.get(), key.c_str()));
        answer.key = key;
        return answer;
    }

    std::vector<Answer> answers() const
    {
        std::vector<Answer> answers;
        const std::size_t count = assay_host_result_answer_count(fResult.get());
        for (std::size_t index = 0; index < count; ++index)
            answers.push_back(make(assay_host_result_answer(fResult.get(), index)));
        return answers;
    }

    // The JSON document.
    std::string document() const
    {
        std::size_t size = 0;
        const char* const text =
            detail::check_made(assay_host_result_document(fResult.get(), &size));
        return {text, size};
    }

    assay_host_result* get() const { return fResult.get(); }

private:
    std::string read(const char* (*text_of)(const assay_host_result*, std::size_t*)) const
    {
        std::size_t size = 0;
        const char* const text = text_of(fResult.get(), &size);
        return {text, size};
    }

    static Answer make(const assay_host_answer* answer)
    {
        Answer made;
        made.key = assay_host_answer_key(answer);
        std::size_t size = 0;
        const char* const text = assay_host_answer_text(answer, &size);
        made.text.assign(text, size);
        made.reason = assay_host_answer_reason(answer);
        const int flag = assay_host_answer_flag(answer);
        if (flag >= 0)
            made.flag = flag != 0;
        switch (assay_host_answer_kind(answer)) {
        case ASSAY_HOST_TEXT:
            made.value = made.text;
            break;
        case ASSAY_HOST_NUMBER:
            made.value = assay_host_answer_number(answer);
            break;
        case ASSAY_HOST_LIST: {
            std::vector<double> list(assay_host_answer_list_size(answer));
            for (std::size_t index = 0; index < list.size(); ++index)
                list[index] = assay_host_answer_list_item(answer, index);
            made.value = std::move(list);
            break;
        }
        default:
            break;
        }
        return made;
    }

    std::shared_ptr<assay_host_result> fResult;
};

// What to do, from memory or from one attempt. Copies share it, and any thread may read it.
class Advice {
public:
    // Takes the ownership.
    explicit Advice(assay_host_advice* advice) : fAdvice(advice, detail::Free()) {}

    Usability usability(Interface which) const
    {
        return static_cast<Usability>(
            assay_host_advice_usable(fAdvice.get(), static_cast<assay_host_interface>(which)));
    }

    Advised of(Interface which) const
    {
        const assay_host_advice* const advice = fAdvice.get();
        const auto number = static_cast<assay_host_interface>(which);
        const auto get = [&](auto read) {
            std::size_t size = 0;
            const char* const text = read(advice, number, &size);
            return std::string(text, size);
        };
        const auto get_seconds = [&](auto read) {
            double seconds = 0;
            return read(advice, number, &seconds) != 0 ? std::optional(seconds) : std::nullopt;
        };
        Advised made;
        made.usability = usability(which);
        made.reason = assay_host_advice_reason(advice, number);
        made.text = assay_host_advice_text(advice, number);
        made.source = assay_host_advice_source(advice, number);
        made.learnt = static_cast<Usability>(assay_host_advice_learnt(advice, number));
        made.device = assay_host_advice_device(advice, number);
        made.device_name = get(assay_host_advice_device_name);
        made.device_driver = get(assay_host_advice_device_driver);
        made.end = assay_host_advice_end(advice, number);
        made.end_text = assay_host_advice_end_text(advice, number);
        made.last_line = get(assay_host_advice_last_line);
        made.age_seconds = get_seconds(assay_host_advice_age);
        made.failures = assay_host_advice_failures(advice, number);
        made.next_attempt_seconds = get_seconds(assay_host_advice_next_attempt);
        made.change = assay_host_advice_change(advice, number);
        made.warning = assay_host_advice_warning(advice, number);
        return made;
    }

    Plan plan() const { return static_cast<Plan>(assay_host_advice_plan(fAdvice.get())); }
    std::string due() const { return assay_host_advice_due(fAdvice.get()); }
    bool tried() const { return assay_host_advice_tried(fAdvice.get()) != 0; }
    bool stopped() const { return assay_host_advice_stopped(fAdvice.get()) != 0; }
    std::string identity() const { return assay_host_advice_identity(fAdvice.get()); }
    std::uint64_t attempts() const { return assay_host_advice_attempts(fAdvice.get()); }

    // The problems with the folder.
    std::vector<std::string> messages() const
    {
        std::vector<std::string> messages;
        const std::size_t count = assay_host_advice_message_count(fAdvice.get());
        for (std::size_t index = 0; index < count; ++index)
            messages.emplace_back(assay_host_advice_message(fAdvice.get(), index));
        return messages;
    }

    // The JSON document.
    std::string document() const
    {
        std::size_t size = 0;
        const char* const text = assay_host_advice_document(fAdvice.get(), &size);
        return {text, size};
    }

    assay_host_advice* get() const { return fAdvice.get(); }

private:
    std::shared_ptr<assay_host_advice> fAdvice;
};

// The folder with the state: the user's choice, and what is remembered. For one thread at a time.
class State {
public:
    // `folder` is in UTF-8. Opens nothing yet.
    explicit State(const std::string& folder)
    {
        assay_host_state* state = nullptr;
        detail::check(assay_host_state_new(folder.c_str(), &state));
        fState.reset(state);
    }

    // Automatic if the folder is missing, or if its file is ignored.
    Choice choice(Interface which)
    {
        assay_host_choice choice = ASSAY_HOST_CHOICE_AUTO;
        detail::check(assay_host_state_get_choice(
            fState.get(), static_cast<assay_host_interface>(which), &choice));
        return static_cast<Choice>(choice);
    }

    // Throws std::runtime_error with the message if the folder can't be changed.
    void set_choice(Interface which, Choice choice)
    {
        check(assay_host_state_set_choice(fState.get(), static_cast<assay_host_interface>(which),
                                          static_cast<assay_host_choice>(choice)));
    }

    // Removes all that is remembered, and the choice. Throws as set_choice(), and during an
    // attempt.
    void forget() { check(assay_host_state_forget(fState.get())); }

    // On what failed in the last call, or on a file that it ignored; empty if nothing did.
    std::string message() const { return assay_host_state_message(fState.get()); }

private:
    void check(assay_host_error error)
    {
        if (error == ASSAY_HOST_NOT_CHANGED)
            throw std::runtime_error(message());
        detail::check(error);
    }

    std::unique_ptr<assay_host_state, detail::Free> fState;
};

// Runs the child to its end, the timeout or a stop (null: none).
inline Result run(const Options& options = {}, Stop* stop = nullptr)
{
    detail::Calls calls{options, nullptr};
    const detail::OptionsHandle handle = detail::make_options(calls);
    assay_host_result* result = nullptr;
    const assay_host_error error =
        assay_host_run(handle.get(), stop != nullptr ? stop->get() : nullptr, &result);
    std::unique_ptr<assay_host_result, detail::Free> owner(result);
    if (calls.failure)
        std::rethrow_exception(calls.failure);
    detail::check(error);
    return Result(owner.release());
}

// Answers from the state in the folder, whose path is in UTF-8, or by one attempt, which ends as
// run() does. The header of the C interface has the details.
inline Advice advise(const std::string& folder, const Options& options = {}, Stop* stop = nullptr)
{
    detail::Calls calls{options, nullptr};
    const detail::OptionsHandle handle = detail::make_options(calls);
    detail::set_advice_options(handle.get(), options);
    assay_host_advice* advice = nullptr;
    const assay_host_error error = assay_host_advise(
        handle.get(), folder.c_str(), stop != nullptr ? stop->get() : nullptr, &advice);
    std::unique_ptr<assay_host_advice, detail::Free> owner(advice);
    if (calls.failure)
        std::rethrow_exception(calls.failure);
    detail::check(error);
    return Advice(owner.release());
}

} // namespace assay

#endif
