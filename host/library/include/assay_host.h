/* SPDX-FileCopyrightText: 2026 the assay authors
 * SPDX-License-Identifier: MIT */

/* libassay-host: runs assay as a supervised child and tells whether OpenGL and OpenCL can be used.
 *
 * A driver that crashes or hangs ends only the child. assay_host_run runs the child once;
 * assay_host_advise remembers its runs, and answers from memory until something changes.
 * docs/embedding.md leads from nothing to a decision.
 *
 * Sizes are in bytes, times in seconds. Texts passed in are UTF-8 and end with a zero byte. Texts
 * returned end with a zero byte, belong to the object that returned them and live as long as it; a
 * text of a driver may contain any bytes, also zero bytes, so that functions with `size` set it to
 * the number of bytes (`size` may be null). No text returned is null, except as stated.
 *
 * Threads: any number of runs and advices at a time. An options object may be read by several
 * threads, and changed only while no other thread uses it. A result and an advice never change: any
 * thread may read them. A stop is for any thread.
 *
 * The host: the library installs no signal handler and changes neither the working directory, nor
 * the locale, nor a descriptor of its host. Its threads have all signals blocked. On Linux the host
 * may ignore SIGCHLD or wait for any child: it doesn't see the library's processes. If the host
 * ends, even if it is killed, the child and its descendants are killed. The shared library can't be
 * unloaded; the DLL can be until its first run.
 *
 * Freeing null does nothing. Reading from null returns 0, an empty text, never-started or unknown,
 * and -1 where a function has it; assay_host_result_document and the functions that return an
 * object return null.
 */
#ifndef ASSAY_HOST_H
#define ASSAY_HOST_H

/* This is C. NOLINTBEGIN(modernize-deprecated-headers,modernize-use-using) */

#include <stddef.h>
#include <stdint.h>

#if defined(ASSAY_HOST_STATIC)
#define ASSAY_HOST_API
#elif defined(_WIN32) && defined(ASSAY_HOST_BUILDING)
#define ASSAY_HOST_API __declspec(dllexport)
#elif defined(_WIN32)
#define ASSAY_HOST_API __declspec(dllimport)
#elif defined(__GNUC__)
#define ASSAY_HOST_API __attribute__((visibility("default")))
#else
#define ASSAY_HOST_API
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* --- Errors of calls ------------------------------------------------------------------------- */

/* What a call returns. A run whose child fails is no error: its result has a verdict. Later
 * versions may add numbers to every enumeration here. */
typedef enum assay_host_error {
    ASSAY_HOST_OK = 0,
    ASSAY_HOST_NO_MEMORY = 1,    /* "out of memory" */
    ASSAY_HOST_NULL_POINTER = 2, /* "a pointer is null" */
    ASSAY_HOST_BAD_VALUE = 3,    /* "a value is out of its range" */
    ASSAY_HOST_BAD_TEXT = 4,     /* "a text is empty" */
    ASSAY_HOST_INTERNAL = 5,     /* "the system refused a thread or another resource" */
    ASSAY_HOST_NOT_CHANGED = 6,  /* "the state can't be changed" */
    ASSAY_HOST_BUSY = 7          /* "another process or thread makes an attempt" */
} assay_host_error;

/* Returns the text above; "unknown error" for other numbers. */
ASSAY_HOST_API const char* assay_host_error_text(assay_host_error error);

/* Returns the version of the library, "1.0.0". */
ASSAY_HOST_API const char* assay_host_version(void);

/* --- Options --------------------------------------------------------------------------------- */

/* What to run and how. Those after the callbacks are for assay_host_advise alone. */
typedef struct assay_host_options assay_host_options;

/* Makes options with the defaults below. Returns null if memory runs out. Free it with
 * assay_host_options_free. */
ASSAY_HOST_API assay_host_options* assay_host_options_new(void);
ASSAY_HOST_API void assay_host_options_free(assay_host_options* options);

/* Sets the path of the program to run. The default is the assay in the folder of the library, else
 * the one in the folder of programs of the same installation (../bin or ../../bin from there). In a
 * static library it is the folder of the program that the library is part of. The PATH isn't
 * searched. Errors: null pointer, bad text, no memory. */
ASSAY_HOST_API assay_host_error assay_host_options_set_program(assay_host_options* options,
                                                               const char* path);

/* Adds an argument of the child, after those added before. Errors: null pointer, no memory. */
ASSAY_HOST_API assay_host_error assay_host_options_add_argument(assay_host_options* options,
                                                                const char* argument);

/* Sets the time after which the child is killed; 0 for no limit; the default is 60. The child is
 * killed at this time, and assay_host_run returns some milliseconds later. It takes longer, at most
 * two seconds in all, only if the system can't end a process at once, as on a driver that blocks in
 * the kernel. Errors: null pointer; bad value for a negative number or one that isn't finite. */
ASSAY_HOST_API assay_host_error assay_host_options_set_timeout(assay_host_options* options,
                                                               double seconds);

/* Set the limits of the report that is kept: all its bytes, those of a line, its lines. What
 * exceeds them is read, dropped and counted. The defaults are 4 MiB, 64 KiB and 24576 lines.
 * Errors: null pointer; bad value for 0 or more than 1 GiB (1 Gi lines). */
ASSAY_HOST_API assay_host_error assay_host_options_set_max_bytes(assay_host_options* options,
                                                                 uint64_t bytes);
ASSAY_HOST_API assay_host_error assay_host_options_set_max_line_bytes(assay_host_options* options,
                                                                      uint64_t bytes);
ASSAY_HOST_API assay_host_error assay_host_options_set_max_lines(assay_host_options* options,
                                                                 uint64_t lines);

/* Whether the JSON document names this machine: 1 or 0, which is the default. Error: null
 * pointer. */
ASSAY_HOST_API assay_host_error assay_host_options_set_identify(assay_host_options* options,
                                                                int identify);

/* Callbacks of a run, with the context of their setter. They are called on the thread of
 * assay_host_run or assay_host_advise, one after the other, `seconds` after the launch. This thread
 * supervises the child: a callback that blocks delays the timeout. It returns 0 to continue, or
 * another number to end the run, with the verdict interrupted. It must not throw or jump out. Null:
 * no callback, which is the default. */

/* A line of the report, or of the child's standard error, without its line end. `line` lives until
 * the callback returns. */
typedef int (*assay_host_line_callback)(void* context, const char* line, size_t size,
                                        double seconds);

/* About ten times a second. `steps`: the steps that the report shows to be done. `next_key`: the
 * key of the report's next line, which is what the child is doing; empty at the end. It lives until
 * the callback returns. */
typedef int (*assay_host_tick_callback)(void* context, double seconds, uint64_t steps,
                                        const char* next_key);

/* Error: null pointer, for the options. */
ASSAY_HOST_API assay_host_error assay_host_options_on_line(assay_host_options* options,
                                                           assay_host_line_callback callback,
                                                           void* context);
ASSAY_HOST_API assay_host_error assay_host_options_on_error_line(assay_host_options* options,
                                                                 assay_host_line_callback callback,
                                                                 void* context);
ASSAY_HOST_API assay_host_error assay_host_options_on_tick(assay_host_options* options,
                                                           assay_host_tick_callback callback,
                                                           void* context);

/* Which interfaces may cause an attempt, 1 or 0 each; the default is OpenGL alone. The advice has
 * both in any case. Errors: null pointer; bad value if both are 0. */
ASSAY_HOST_API assay_host_error assay_host_options_set_need(assay_host_options* options, int opengl,
                                                            int opencl);

/* Whether results of earlier attempts are due for another one at any age: 1 or 0, which is the
 * default. The pauses after failures stay. Error: null pointer. */
ASSAY_HOST_API assay_host_error assay_host_options_set_fresh(assay_host_options* options,
                                                             int fresh);

/* Whether to show only what a call would do, and why, without doing it: 1 or 0, which is the
 * default. Then nothing is written and no child is started. Error: null pointer. */
ASSAY_HOST_API assay_host_error assay_host_options_set_dry_run(assay_host_options* options,
                                                               int dry_run);

/* Sets how long to wait for the attempt of another process or thread; the default is 10. Errors:
 * null pointer; bad value for a negative number or one that isn't finite. */
ASSAY_HOST_API assay_host_error assay_host_options_set_wait(assay_host_options* options,
                                                            double seconds);

/* What decides when there is another attempt. The comments have the defaults; docs/advise.md has
 * the rules. */
typedef enum assay_host_policy {
    ASSAY_HOST_MAX_AGE = 0,        /* 30 days; hardware and software are tried again after this */
    ASSAY_HOST_KEEP_ABSENT = 1,    /* 600; absent is */
    ASSAY_HOST_KEEP_UNKNOWN = 2,   /* 60; unknown is, if a child ended by itself */
    ASSAY_HOST_PAUSE = 3,          /* 60, before the second attempt after a failure */
    ASSAY_HOST_PAUSE_GROWTH = 4,   /* 60; each further pause is longer by this factor */
    ASSAY_HOST_RETRIES = 5,        /* 2 attempts after a first failure */
    ASSAY_HOST_FORGIVE = 6,        /* 7 days; failures that are older don't count */
    ASSAY_HOST_FORGIVE_FREEZE = 7, /* 30 days; ends of the system that are older don't count */
    ASSAY_HOST_UNCLEAR = 8,        /* 3 attempts in a row that may show nothing */
    ASSAY_HOST_UNCLEAR_PAUSE = 9   /* 600, before the next attempt after so many */
} assay_host_policy;

/* Sets a value of the policy: a time, a factor or a number of attempts. Times of more than 100
 * years are 100 years. Errors: null pointer; bad value for another number of the enumeration, a
 * time that is negative or not finite, a number of retries that isn't a whole one from 0 to 1000,
 * and a factor or another number that isn't a whole one from 1 to 1000. */
ASSAY_HOST_API assay_host_error assay_host_options_set_policy(assay_host_options* options,
                                                              assay_host_policy which,
                                                              double value);

/* --- Runs ------------------------------------------------------------------------------------ */

/* A request to end runs. */
typedef struct assay_host_stop assay_host_stop;

/* Returns null if memory runs out. Free it after the runs that got it have returned. */
ASSAY_HOST_API assay_host_stop* assay_host_stop_new(void);
ASSAY_HOST_API void assay_host_stop_free(assay_host_stop* stop);

/* Ends the runs and advices that got this stop, and all that get it later: a run with the verdict
 * interrupted, an advice without blame for a driver. Can't be withdrawn. Any thread may call, but
 * no signal handler. Error: null pointer. */
ASSAY_HOST_API assay_host_error assay_host_stop_raise(assay_host_stop* stop);

/* What a run has brought. */
typedef struct assay_host_result assay_host_result;

/* Runs the child to its end, the timeout, or a stop (null: none), and sets `*result`, which the
 * caller frees with assay_host_result_free. Null options: the defaults. On an error `*result` is
 * null. Errors: null pointer, no memory, internal. */
ASSAY_HOST_API assay_host_error assay_host_run(const assay_host_options* options,
                                               assay_host_stop* stop, assay_host_result** result);
ASSAY_HOST_API void assay_host_result_free(assay_host_result* result);

/* --- How the run ended ----------------------------------------------------------------------- */

typedef enum assay_host_verdict {
    ASSAY_HOST_COMPLETE = 0,      /* a whole report, and no test failed */
    ASSAY_HOST_FAILED_TESTS = 1,  /* the child ended by itself in any other way */
    ASSAY_HOST_USAGE_ERROR = 2,   /* the child rejected its arguments */
    ASSAY_HOST_CRASHED = 3,       /* a signal, or on Windows a code above 255, ended the child */
    ASSAY_HOST_HUNG = 4,          /* the child was killed at the timeout */
    ASSAY_HOST_NEVER_STARTED = 5, /* the child could not be started */
    ASSAY_HOST_INTERRUPTED = 6    /* a stop or a callback ended the run */
} assay_host_verdict;

ASSAY_HOST_API assay_host_verdict assay_host_result_verdict(const assay_host_result* result);

/* Returns "complete", "failed-tests", "usage-error", "crashed", "hung", "never-started" or
 * "interrupted"; "unknown" for other numbers. */
ASSAY_HOST_API const char* assay_host_verdict_name(assay_host_verdict verdict);

/* Returns one sentence for the user, safe to write to a terminal. */
ASSAY_HOST_API const char* assay_host_result_reason(const assay_host_result* result);

/* Returns 1 and sets `*status` to the child's exit status if it ended by itself, otherwise returns
 * 0. */
ASSAY_HOST_API int assay_host_result_exit_status(const assay_host_result* result, int* status);

/* Returns what ended a crashed child, such as "signal 11 (Segmentation fault)" or "code
 * 0xC0000005"; otherwise an empty text. */
ASSAY_HOST_API const char* assay_host_result_termination(const assay_host_result* result);

/* Returns the time from the launch to the child's end. */
ASSAY_HOST_API double assay_host_result_seconds(const assay_host_result* result);

/* Return the last line of the report, and the last line of the child's log after it, which shows
 * what the child was doing. Empty if there is none. */
ASSAY_HOST_API const char* assay_host_result_last_line(const assay_host_result* result,
                                                       size_t* size);
ASSAY_HOST_API const char* assay_host_result_last_log_line(const assay_host_result* result,
                                                           size_t* size);

/* Return the lines of the child's standard error, without their line ends. Empty beyond the
 * count. */
ASSAY_HOST_API size_t assay_host_result_error_line_count(const assay_host_result* result);
ASSAY_HOST_API const char* assay_host_result_error_line(const assay_host_result* result,
                                                        size_t index, size_t* size);

/* Return the bytes that the limits dropped of the report and of standard error. */
ASSAY_HOST_API uint64_t assay_host_result_lost_bytes(const assay_host_result* result);
ASSAY_HOST_API uint64_t assay_host_result_lost_error_bytes(const assay_host_result* result);

/* Returns 1 if a process of the child could not be killed and may still run. */
ASSAY_HOST_API int assay_host_result_left_behind(const assay_host_result* result);

/* --- What can be used ------------------------------------------------------------------------ */

typedef enum assay_host_interface {
    ASSAY_HOST_OPENGL = 0,
    ASSAY_HOST_OPENCL = 1
} assay_host_interface;

typedef enum assay_host_usability {
    ASSAY_HOST_HARDWARE = 0, /* a device with graphics hardware passed its trials */
    ASSAY_HOST_SOFTWARE = 1, /* only software renderers did */
    ASSAY_HOST_BROKEN = 2,   /* the library or a device crashed, hung or failed */
    ASSAY_HOST_ABSENT = 3,   /* there is no library or no device */
    ASSAY_HOST_UNKNOWN = 4   /* the run doesn't show it */
} assay_host_usability;

ASSAY_HOST_API assay_host_usability assay_host_result_usable(const assay_host_result* result,
                                                             assay_host_interface which);

/* Returns "hardware", "software", "broken", "absent" or "unknown". */
ASSAY_HOST_API const char* assay_host_usability_name(assay_host_usability usability);

/* Return a stable identifier of the reason, one sentence for the user, and the tag of the device
 * that decided, which is empty for none. docs/assay-host.md has the reasons. */
ASSAY_HOST_API const char* assay_host_result_usable_reason(const assay_host_result* result,
                                                           assay_host_interface which);
ASSAY_HOST_API const char* assay_host_result_usable_text(const assay_host_result* result,
                                                         assay_host_interface which);
ASSAY_HOST_API const char* assay_host_result_usable_device(const assay_host_result* result,
                                                           assay_host_interface which);

/* --- Warnings -------------------------------------------------------------------------------- */

/* Return a stable identifier, the tag of the device (empty: of the whole run), the text for the
 * user, and its cause from the child's log (empty if there is none). Empty beyond the count. */
ASSAY_HOST_API size_t assay_host_result_warning_count(const assay_host_result* result);
ASSAY_HOST_API const char* assay_host_result_warning_code(const assay_host_result* result,
                                                          size_t index);
ASSAY_HOST_API const char* assay_host_result_warning_device(const assay_host_result* result,
                                                            size_t index);
ASSAY_HOST_API const char* assay_host_result_warning_text(const assay_host_result* result,
                                                          size_t index);
ASSAY_HOST_API const char* assay_host_result_warning_cause(const assay_host_result* result,
                                                           size_t index);

/* --- Devices --------------------------------------------------------------------------------- */

/* A device of the report. Belongs to the result. */
typedef struct assay_host_device assay_host_device;

/* The OpenGL devices, then the OpenCL devices, by index. Null beyond the count. */
ASSAY_HOST_API size_t assay_host_result_device_count(const assay_host_result* result);
ASSAY_HOST_API const assay_host_device* assay_host_result_device(const assay_host_result* result,
                                                                 size_t index);

/* Returns the tag, "glgpu[0]" or "clgpu[1]". */
ASSAY_HOST_API const char* assay_host_device_tag(const assay_host_device* device);
ASSAY_HOST_API assay_host_interface assay_host_device_interface(const assay_host_device* device);

/* Returns 1 if the device has all answers, 1 if one of its tests failed, and 1 if it is a software
 * renderer, -1 if its answers don't show that. */
ASSAY_HOST_API int assay_host_device_complete(const assay_host_device* device);
ASSAY_HOST_API int assay_host_device_failed(const assay_host_device* device);
ASSAY_HOST_API int assay_host_device_software(const assay_host_device* device);

/* --- Answers --------------------------------------------------------------------------------- */

/* The answer to a key of the report: a value, or the reason why there is none. Belongs to the
 * result. */
typedef struct assay_host_answer assay_host_answer;

typedef enum assay_host_kind {
    ASSAY_HOST_NOTHING = 0, /* no line, or a value that stands for "not known" */
    ASSAY_HOST_TEXT = 1,
    ASSAY_HOST_NUMBER = 2,
    ASSAY_HOST_LIST = 3 /* of numbers */
} assay_host_kind;

/* Returns the answer to a key: "NumGLGPUs", "glgpu[0].GLMemoryMB". Null if the report never has the
 * key: neither the table of keys nor a line of it names it. */
ASSAY_HOST_API const assay_host_answer* assay_host_result_find(const assay_host_result* result,
                                                               const char* key);

/* All answers: those without a tag, then those of each device. Null beyond the count. */
ASSAY_HOST_API size_t assay_host_result_answer_count(const assay_host_result* result);
ASSAY_HOST_API const assay_host_answer* assay_host_result_answer(const assay_host_result* result,
                                                                 size_t index);

/* Returns the key with its tag. */
ASSAY_HOST_API const char* assay_host_answer_key(const assay_host_answer* answer);
ASSAY_HOST_API assay_host_kind assay_host_answer_kind(const assay_host_answer* answer);

/* Returns why there is nothing, in English, such as "device failed before"; "no such key" for a
 * null answer; empty for an answer of another kind. */
ASSAY_HOST_API const char* assay_host_answer_reason(const assay_host_answer* answer);

/* Returns the value as the report has it, without quotes, for each kind. For nothing it may be what
 * stands for "not known", such as "?"; empty without a line. */
ASSAY_HOST_API const char* assay_host_answer_text(const assay_host_answer* answer, size_t* size);

/* Returns a number; 0 for another kind. Integers are exact up to 2^53. */
ASSAY_HOST_API double assay_host_answer_number(const assay_host_answer* answer);

/* Returns 1 for yes, 0 for no, and -1 if the answer is no flag. */
ASSAY_HOST_API int assay_host_answer_flag(const assay_host_answer* answer);

/* Return the numbers of a list; 0 beyond the count. */
ASSAY_HOST_API size_t assay_host_answer_list_size(const assay_host_answer* answer);
ASSAY_HOST_API double assay_host_answer_list_item(const assay_host_answer* answer, size_t index);

/* --- The document ---------------------------------------------------------------------------- */

/* Returns the JSON document of the run, as assay-host run --format json writes it (schema 2). It is
 * made at the first call. Null if memory runs out. */
ASSAY_HOST_API const char* assay_host_result_document(const assay_host_result* result,
                                                      size_t* size);

/* --- Advice ---------------------------------------------------------------------------------- */

/* What to do, from memory or from one attempt. docs/advise.md has the rules. */
typedef struct assay_host_advice assay_host_advice;

/* Answers what can be used, and sets `*advice`, which the caller frees with
 * assay_host_advice_free. The answer comes from the folder without a child, unless an attempt is
 * due: then the child runs as in assay_host_run, and its result is kept. While another process or
 * thread makes an attempt with the same folder, the call waits for its answer.
 *
 * `folder` is the path of the folder with the state. It is created if it is missing, but not its
 * parents. Several programs and threads may share it. If it can't be used, that is no error: each
 * call makes an attempt, at most one, and the advice has a message.
 *
 * What is known holds for one set of adapters, drivers, system and assay. The arguments of the
 * options are passed to the child, but don't count among these. No driver is loaded to collect
 * them. The environment of this process is read, so that no other thread may change it meanwhile.
 *
 * Before the child starts, the attempt is on the disk with this process as its host. If the process
 * ends during it, that is weak evidence; if the system ends, it counts as a freeze. A host that is
 * asked to end should raise the stop, and wait for the return: then nobody is blamed.
 *
 * Null options: the defaults. Null stop: none. On an error `*advice` is null. Errors: null pointer;
 * bad text for an empty path; no memory; internal. */
ASSAY_HOST_API assay_host_error assay_host_advise(const assay_host_options* options,
                                                  const char* folder, assay_host_stop* stop,
                                                  assay_host_advice** advice);
ASSAY_HOST_API void assay_host_advice_free(assay_host_advice* advice);

/* Returns what can be used: the user's choice, or what was learnt. */
ASSAY_HOST_API assay_host_usability assay_host_advice_usable(const assay_host_advice* advice,
                                                             assay_host_interface which);

/* Return a stable identifier of the reason, and one sentence for the user, safe to write to a
 * terminal. docs/advise.md has the reasons. */
ASSAY_HOST_API const char* assay_host_advice_reason(const assay_host_advice* advice,
                                                    assay_host_interface which);
ASSAY_HOST_API const char* assay_host_advice_text(const assay_host_advice* advice,
                                                  assay_host_interface which);

/* Returns what the answer is from: "attempt" of this call, "memory", "choice" of the user, or
 * "none". Empty for null. */
ASSAY_HOST_API const char* assay_host_advice_source(const assay_host_advice* advice,
                                                    assay_host_interface which);

/* Returns the answer without the user's choice. */
ASSAY_HOST_API assay_host_usability assay_host_advice_learnt(const assay_host_advice* advice,
                                                             assay_host_interface which);

/* Return the tag, the name and the driver of the device that decided; empty if they aren't
 * known. */
ASSAY_HOST_API const char* assay_host_advice_device(const assay_host_advice* advice,
                                                    assay_host_interface which);
ASSAY_HOST_API const char* assay_host_advice_device_name(const assay_host_advice* advice,
                                                         assay_host_interface which, size_t* size);
ASSAY_HOST_API const char* assay_host_advice_device_driver(const assay_host_advice* advice,
                                                           assay_host_interface which,
                                                           size_t* size);

/* Return how the attempt ended: "ended", "crashed", "hung", "killed", "not-started",
 * "host-stopped", "host-ended" or "system-ended"; a sentence about it; and, if it didn't bring a
 * usable device, the last line of the child's log or report. Empty if there is none. */
ASSAY_HOST_API const char* assay_host_advice_end(const assay_host_advice* advice,
                                                 assay_host_interface which);
ASSAY_HOST_API const char* assay_host_advice_end_text(const assay_host_advice* advice,
                                                      assay_host_interface which);
ASSAY_HOST_API const char* assay_host_advice_last_line(const assay_host_advice* advice,
                                                       assay_host_interface which, size_t* size);

/* Returns 1 and sets `*seconds` to the age of the answer: that of the attempt or of the choice.
 * Otherwise returns 0. */
ASSAY_HOST_API int assay_host_advice_age(const assay_host_advice* advice,
                                         assay_host_interface which, double* seconds);

/* Returns the failures that count, since the last success. */
ASSAY_HOST_API uint64_t assay_host_advice_failures(const assay_host_advice* advice,
                                                   assay_host_interface which);

/* Returns 1 and sets `*seconds` to the time from this advice to the next attempt, if that is later
 * than the next call; otherwise returns 0. */
ASSAY_HOST_API int assay_host_advice_next_attempt(const assay_host_advice* advice,
                                                  assay_host_interface which, double* seconds);

/* Return one sentence on what would change the answer, and one that warns of an answer that may
 * not last; the latter may be empty. */
ASSAY_HOST_API const char* assay_host_advice_change(const assay_host_advice* advice,
                                                    assay_host_interface which);
ASSAY_HOST_API const char* assay_host_advice_warning(const assay_host_advice* advice,
                                                     assay_host_interface which);

typedef enum assay_host_plan {
    ASSAY_HOST_ANSWER = 0, /* memory has the answer */
    ASSAY_HOST_TRY = 1,    /* an attempt was due, or with a dry run is */
    ASSAY_HOST_WAIT = 2    /* another process or thread makes one */
} assay_host_plan;

ASSAY_HOST_API assay_host_plan assay_host_advice_plan(const assay_host_advice* advice);

/* Returns "answer", "try" or "wait"; "unknown" for other numbers. */
ASSAY_HOST_API const char* assay_host_plan_name(assay_host_plan plan);

/* Returns why an attempt was due, such as "first"; "not-due" if none was. docs/advise.md has the
 * identifiers. Empty for null. */
ASSAY_HOST_API const char* assay_host_advice_due(const assay_host_advice* advice);

/* Return 1 if this call made an attempt, and 1 if a stop or a callback ended the call. */
ASSAY_HOST_API int assay_host_advice_tried(const assay_host_advice* advice);
ASSAY_HOST_API int assay_host_advice_stopped(const assay_host_advice* advice);

/* Return the name of the set of adapters, drivers, system and assay, and the number of all attempts
 * with it. */
ASSAY_HOST_API const char* assay_host_advice_identity(const assay_host_advice* advice);
ASSAY_HOST_API uint64_t assay_host_advice_attempts(const assay_host_advice* advice);

/* Return the problems with the folder, each a sentence. Empty beyond the count. */
ASSAY_HOST_API size_t assay_host_advice_message_count(const assay_host_advice* advice);
ASSAY_HOST_API const char* assay_host_advice_message(const assay_host_advice* advice, size_t index);

/* Returns the JSON document, as assay-host advise --format json writes it (schema 1). */
ASSAY_HOST_API const char* assay_host_advice_document(const assay_host_advice* advice,
                                                      size_t* size);

/* --- The state ------------------------------------------------------------------------------- */

/* The folder with the state: what is remembered, and the user's choice. For one thread at a time;
 * several objects, of several threads and programs, may have one folder. */
typedef struct assay_host_state assay_host_state;

/* Sets `*state`, which the caller frees with assay_host_state_free. Doesn't open the folder yet.
 * Errors: null pointer; bad text for an empty path; no memory. Then `*state` is null. */
ASSAY_HOST_API assay_host_error assay_host_state_new(const char* folder, assay_host_state** state);
ASSAY_HOST_API void assay_host_state_free(assay_host_state* state);

/* Returns a sentence on what failed in the last call with this object, or on a file that it
 * ignored; empty if nothing did. Lives until the next call with it. */
ASSAY_HOST_API const char* assay_host_state_message(const assay_host_state* state);

/* What the user decided. It holds for every identity, and there is no attempt for an interface that
 * is chosen. */
typedef enum assay_host_choice {
    ASSAY_HOST_CHOICE_AUTO = 0, /* nothing: what is learnt holds */
    ASSAY_HOST_CHOICE_HARDWARE = 1,
    ASSAY_HOST_CHOICE_SOFTWARE = 2,
    ASSAY_HOST_CHOICE_ABSENT = 3
} assay_host_choice;

/* Reads the choice, which is auto if the folder is missing or its file is ignored. Errors: null
 * pointer; bad value for the interface; no memory. Then it is auto. */
ASSAY_HOST_API assay_host_error assay_host_state_get_choice(assay_host_state* state,
                                                            assay_host_interface which,
                                                            assay_host_choice* choice);

/* Writes the choice; creates the folder if it is missing. Of two calls at a time the last one
 * holds, for both interfaces. Errors: null pointer; bad value for the interface or the choice; not
 * changed, with a message; no memory. */
ASSAY_HOST_API assay_host_error assay_host_state_set_choice(assay_host_state* state,
                                                            assay_host_interface which,
                                                            assay_host_choice choice);

/* Removes all that is remembered, and the choice, so that the next advice makes an attempt. Errors:
 * null pointer; busy while another process or thread makes an attempt; not changed, with a message;
 * no memory. */
ASSAY_HOST_API assay_host_error assay_host_state_forget(assay_host_state* state);

#ifdef __cplusplus
}
#endif

/* NOLINTEND(modernize-deprecated-headers,modernize-use-using) */

#endif
