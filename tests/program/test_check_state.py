"""`assay-host check --state`: requirements answered from the memory of `assay-host advise`."""

import os
import re
import signal
import uuid

import pytest

from harness import until
from hosting import HOST_ON_CUE, host_run
from starts import DAY, HARDWARE, INTERRUPTED, Starts

GL, CL = "opengl.usable==hardware", "opencl.usable==hardware"
NOT_TRIED = f"not met: {GL}: not known (OpenGL has not been tried.)\n"


class Checks(Starts):
    """The starts of a host, between which the machine is checked."""

    def check(self, *texts, options=(), state=None):
        """The status and the lines. A check starts no child, and changes no file."""
        before = self.children, self.files()
        run = host_run("check", "--state", str(state or self.state), "--assay", str(self.child), *options,
                       *(word for text in texts for word in ("--require", text)),
                       program=HOST_ON_CUE, environment=self.environment)
        assert (self.children, self.files()) == before
        return run.status, run.text, run.err.decode()

    def files(self):
        return {path: (path.stat().st_mtime_ns, path.read_bytes()) for path in self.state.glob("*")}


@pytest.fixture(name="checks")
def fixture_checks(host, tmp_path):
    return Checks(host, tmp_path)


def test_what_was_tried_is_checked_without_a_child(checks):
    assert checks.advise("--need", "both").opengl == "hardware"
    assert checks.check(GL) == (0, "met: the requirement\n", "")
    assert checks.check(GL, "opengl.usable!=broken") == (0, "met: all 2 requirements\n", "")
    status, text, err = checks.check("opengl.usable!=hardware", CL)
    lines = text.splitlines()
    assert (status, len(lines), err) == (7, 2, "")
    assert re.fullmatch(r"not met: opengl.usable!=hardware: hardware \(.*\)", lines[0])
    assert re.fullmatch(r"not met: opencl.usable==hardware: absent \(.*\)", lines[1])


@pytest.mark.parametrize("text", [
    "GLVersion>=1", "all GLFrameBufferOK==1", "glgpu[0].GLMemoryMB>=1", "NumGLGPUs>=0", "opengl.devices>=0",
    "opencl.devices==0"])
def test_what_the_state_does_not_have_is_not_met(checks, text):
    checks.advise()
    assert checks.check(GL, text) == (7, f"not met: {text}: not kept in the state; check without --state\n", "")


def test_a_crash_is_remembered(checks):
    checks.set_driver("at 1 eglCreateContext crash\n")
    told = checks.advise().document["opengl"]["text"]
    assert checks.check(GL) == (7, f"not met: {GL}: broken ({told})\n", "")
    assert checks.check("opengl.usable==broken")[0] == 0
    # The run ended before OpenCL was tried.
    for relation in "==", "!=":
        status, text, _ = checks.check(f"opencl.usable{relation}hardware")
        assert status == 7
        assert text.startswith(f"not met: opencl.usable{relation}hardware: not known (")


def test_the_cause_of_a_failure_is_shown(checks):
    """From memory, and by a run."""
    checks.set_driver("at eglCreateContext error EGL_BAD_ALLOC\n")
    text = (f"not met: {GL}: broken (No OpenGL context could be created on any display device: "
            "eglCreateContext failed for display device egl:0: EGL_BAD_ALLOC (0x3003).)\n")
    checks.advise()
    assert checks.check(GL) == (7, text, "")
    run = host_run("check", "--require", GL, "--assay", checks.child, environment=checks.environment)
    assert (run.status, run.text, run.err) == (7, text, b"")


def test_folder_that_cannot_be_used_is_an_error(checks, tmp_path):
    missing = tmp_path / "nothing"
    assert checks.check(GL, state=missing) == (
        10, "", f"assay-host: {missing}: No such file or directory\n")
    assert not missing.exists()
    checks.advise()
    checks.state.chmod(0o777)
    status, text, err = checks.check(GL)
    assert (status, text) == (10, "")
    assert err.startswith(f"assay-host: {checks.state}: ")


def test_nothing_is_known_of_an_empty_folder(checks):
    checks.state.mkdir()
    assert checks.check(GL) == (7, NOT_TRIED, "")
    # Not even what it is not.
    assert checks.check("opengl.usable!=broken")[0] == 7
    assert checks.check("opengl.usable==unknown")[0] == 7


def test_what_is_known_of_another_state_of_the_machine_does_not_count(checks):
    checks.advise()
    checks.variables = {"LIBGL_ALWAYS_SOFTWARE": "1"}
    status, text, err = checks.check(GL, "opengl.usable!=broken")
    assert (status, err) == (7, "")
    reason = (r"not known \(OpenGL has not been tried since the machine, a driver or assay changed; "
              r"the newest result is of \d{4}-\d\d-\d\dT\d\d:\d\d:\d\dZ\.\)")
    first, second = text.splitlines()
    assert re.fullmatch("not met: " + re.escape(GL) + ": " + reason, first)
    assert re.fullmatch("not met: opengl.usable!=broken: " + reason, second)
    checks.advise()
    assert checks.check(GL)[0] == 0
    checks.variables = {}
    assert checks.check(GL)[0] == 0


def test_what_is_too_old_does_not_count(checks):
    checks.advise()

    def age(content):
        content["attempts"][-1]["ended"] -= 31 * DAY

    checks.rewrite(age)
    assert checks.check(GL) == (7, f"not met: {GL}: not known (What is known of OpenGL is too old.)\n", "")
    assert checks.check(GL, options=["--max-age", "32"])[0] == 0
    assert checks.check(GL, options=["--max-age", "30.5"])[0] == 7


def test_damaged_file_is_nothing_known_with_a_message(checks):
    checks.advise()
    file = checks.file()
    file.write_bytes(b"x")
    file.with_stem(str(uuid.UUID(int=0))).write_bytes(b"x") # of another state of the machine
    status, text, err = checks.check(GL)
    assert (status, text) == (7, NOT_TRIED)
    assert err == f"assay-host: The state file {file.name} is ignored: it is damaged.\n"


def test_the_choice_of_the_user_says_nothing_about_the_machine(checks):
    checks.advise()
    assert checks.act("set", "opengl=software").status == 0
    assert checks.check(GL) == (0, "met: the requirement\n", "")
    assert checks.act("forget").status == 0
    assert checks.act("set", "opengl=hardware").status == 0
    assert checks.check(GL) == (7, NOT_TRIED, "")


def test_attempt_in_progress_is_not_waited_for(checks):
    checks.set_driver("at eglInitialize hang\n")
    with checks.start("--timeout", "0") as call:
        until(lambda: checks.has_open_attempt() and checks.children == 1, "no attempt")
        assert checks.check(GL) == (
            7, f"not met: {GL}: not known (Another process is trying the drivers at this moment.)\n", "")
        os.kill(call.process.pid, signal.SIGTERM)
        assert call.finish().status == INTERRUPTED
    checks.set_driver("")
    assert checks.advise().status == HARDWARE
    assert checks.check(GL)[0] == 0


def test_attempt_in_progress_counts_only_for_what_is_due(checks):
    """OpenGL is known for a month, and the absence of OpenCL for ten minutes."""
    other = "Another process is trying the drivers at this moment."
    checks.advise()

    def age(content):
        content["attempts"][-1]["ended"] -= 1000

    checks.rewrite(age)
    checks.set_driver("at eglInitialize hang\n")
    with checks.start("--timeout", "0", "--need", "opencl") as call:
        until(lambda: checks.has_open_attempt() and checks.children == 2, "no attempt")
        assert checks.check(GL)[0] == 0
        assert other in checks.check(CL)[1]
        assert checks.check(GL, CL)[1].count(other) == 2
        assert other in checks.check(GL, options=["--max-age", "0.001"])[1]
        os.kill(call.process.pid, signal.SIGTERM)
        assert call.finish().status == INTERRUPTED


def test_attempt_in_progress_does_not_hide_what_is_known(checks):
    """The absence of OpenCL is known; what is known of OpenGL is too old here."""
    checks.advise()

    def age(content):
        content["attempts"][-1]["ended"] -= 100

    checks.rewrite(age)
    checks.set_driver("at eglInitialize hang\n")
    with checks.start("--timeout", "0", "--fresh") as call:
        until(lambda: checks.has_open_attempt() and checks.children == 2, "no attempt")
        status, text, _ = checks.check(CL, options=["--max-age", "0.001"])
        assert status == 7
        assert text.startswith(f"not met: {CL}: absent (")
        os.kill(call.process.pid, signal.SIGTERM)
        assert call.finish().status == INTERRUPTED
