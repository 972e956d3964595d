"""What user-mode emulation of another processor can't run: tests by file and name, each group with what the
emulator lacks (QEMU 7.2). conftest.py skips them in such a build; test_emulation.py compares the names with
the files. A file alone stands for all its tests."""

LEFT_OUT = {
    "the emulator makes a fork of vfork, which loses the failure of a start": [
        "advise::test_a_child_that_cannot_be_started_says_nothing",
        "bugreport::test_a_child_that_is_not_there",
        "driver_files::test_a_child_without_a_list",
        "host_hostile::test_control_bytes_of_arguments_are_shown_escaped[arguments9]",
        "host_hostile::test_control_bytes_of_arguments_are_shown_escaped[arguments10]",
        "host_hostile::test_missing",
        "host_hostile::test_directory",
        "host_hostile::test_no_permission",
        "host_hostile::test_foreign_executable",
        "host_hostile::test_missing_interpreter",
        "host_torture::test_failing_undisturbed_run",
        "html::test_a_page_says_what_happened[never-started]",
        "series::test_what_can_not_run_is_not_repeated",
    ],
    "the emulator refuses PR_SET_CHILD_SUBREAPER, so that assay-host can't end orphans": [
        "fault_sweep::test_fault_in_every_call[grandchild]",
        "host_end::test_sudden_end[kill_worker]",
        "host_end::test_sudden_end[quit_worker]",
        "host_end::test_sudden_end_again_and_again",
        "host_end::test_suspended_and_continued",
        "host_hostile::test_closed_streams",
        "host_hostile::test_grandchild",
        "host_hostile::test_grandchild_that_floods",
        "host_hostile::test_grandchild_of_a_child_that_hangs",
    ],
    "the emulator refuses PR_SET_PDEATHSIG for signal 64, so that a worker lives on without its guardian": [
        "host_end::test_sudden_end[kill_by_name]",
        "host_end::test_sudden_end[kill_group]",
        "host_end::test_sudden_end[kill_host]",
        "host_end::test_sudden_end_of_other_commands",
    ],
    "the emulator shows a forked process its parent's start time, so that others take a worker for ended": [
        "check_state::test_attempt_in_progress_counts_only_for_what_is_due",
        "check_state::test_attempt_in_progress_does_not_hide_what_is_known",
        "check_state::test_attempt_in_progress_is_not_waited_for",
    ],
    "signal 34 of another process ends the emulator": [
        "host_end::test_signal_that_ends[34]",
    ],
    "the emulator needs minutes for hundreds of megabytes; endless floods and long lines run": [
        "host_hostile::test_flood",
        "host_hostile::test_flood_on_standard_error",
    ],
    "the emulator has 20 to 30 MiB of its own, and takes twelve times as long": [
        "host_memory",
    ],
    "the machine's drivers are for another processor": [
        "opencl::test_mesa_as_gpu",
        "opengl_peers",
    ],
    "the machine's programs can't load a library for another processor": [
        "library",
        "library_advice",
    ],
}


def reason_of(file, name):
    """Why this test of test_FILE.py is left out; None if it isn't. `name` may have parameters."""
    function = name.split("[")[0]
    names = {file, f"{file}::{function}", f"{file}::{name}"}
    return next((reason for reason, tests in LEFT_OUT.items() if names & set(tests)), None)
