"""What user-mode emulation of another processor can't run: tests by file and name, each group with what the
emulator lacks (QEMU 7.2). conftest.py skips them in such a build; test_emulation.py compares the names with
the files. A file alone stands for all its tests."""

LEFT_OUT = {
    "the emulator makes a fork of vfork, which loses the failure of a start": [
        "advise::test_a_child_that_cannot_be_started_says_nothing",
        "host_hostile::test_missing",
        "host_hostile::test_directory",
        "host_hostile::test_no_permission",
        "host_hostile::test_foreign_executable",
        "host_hostile::test_missing_interpreter",
    ],
    "the emulator refuses PR_SET_CHILD_SUBREAPER, so that assay-host can't end orphans": [
        "fault_sweep::test_fault_in_every_call[grandchild]",
        "host_hostile::test_grandchild",
        "host_hostile::test_grandchild_that_floods",
        "host_hostile::test_grandchild_of_a_child_that_hangs",
    ],
    "the emulator needs minutes for hundreds of megabytes; endless floods and long lines run": [
        "host_hostile::test_flood",
        "host_hostile::test_flood_on_standard_error",
    ],
    "the emulator has memory of its own": [
        "host_memory",
    ],
    "the machine's drivers are for another processor": [
        "opengl_peers",
    ],
    "the machine's programs can't load a library for another processor": [
        "library",
    ],
}


def reason_of(file, name):
    """Why this test of test_FILE.py is left out; None if it isn't. `name` may have parameters."""
    function = name.split("[")[0]
    names = {file, f"{file}::{function}", f"{file}::{name}"}
    return next((reason for reason, tests in LEFT_OUT.items() if names & set(tests)), None)
