"""`assay-host torture`: every step on real and scripted machines, and children that break the rules."""

import os
import pty
import re
import select
import shutil
import signal

import pytest

from harness import DEADLINE, PROGRAM, PROGRAM_AT_ROOT, until
from hosting import HOST, TIMEOUT, Cue, Watched, host_run, read_to_the_end, script_child
from model import Gpu
from test_opencl import Machine

SUMMARY = re.compile(r"(\d+) runs, each as predicted, in \d+\.\d s\.\n$")


def torture(environment, *options, assay=PROGRAM, **more):
    return host_run("torture", "--assay", assay, *options, environment=environment, **more)


def test_two_devices_of_each_kind(host):
    machine = Machine(host, gl=2)
    machine.script("".join(platform.script() for platform in machine.platforms))
    run = torture(host.environment(**machine.found), assay=PROGRAM_AT_ROOT)
    steps = 10 + 2 * 35 + 2 * 12
    assert run.text.startswith(f"2 OpenGL and 2 OpenCL devices, {steps} steps.\n"
                               f"-crashAfter=0 to {steps}: as predicted.\n"
                               f"-throwAfter=0 to {steps}: as predicted.\n")
    assert int(SUMMARY.search(run.text).group(1)) == 2 * (steps + 1)
    assert (run.status, run.err) == (0, b"")


@pytest.mark.parametrize("kind, runs", [("crash", 10), ("throw", 10), ("both", 20)])
def test_kinds(host, kind, runs):
    run = torture(host.environment(script="# nothing\n", opencl="absent"), "--kind", kind)
    assert run.text.startswith("0 OpenGL and no OpenCL devices, 9 steps.\n")
    assert int(SUMMARY.search(run.text).group(1)) == runs
    assert ("crashAfter" in run.text, "throwAfter" in run.text) == (kind != "throw",
                                                                    kind != "crash")


def test_device_that_fails_by_itself(host):
    """In the middle of its tests, and at a test that prints before it queries."""
    for rule in ("at glGetString(GL_RENDERER) error GL_INVALID_OPERATION",
                 "at glGetString(GL_SHADING_LANGUAGE_VERSION) error GL_INVALID_OPERATION"):
        run = torture(host.environment(script=Gpu().script() + rule + "\n", opencl="absent"))
        assert run.status == 0, run.text


def test_child_options_are_passed_on(host):
    run = torture(host.environment(script=Gpu().script(), opencl="absent"), "--kind", "throw", "--",
                  "-exit=7", "-stdout=in front", "-verbose=1")
    assert run.status == 0, run.text


def wrapped(folder, condition, action):
    """A child that is assay, except when the condition holds for its last argument."""
    return script_child(folder, f'for last; do :; done\ncase "$last" in\n{condition}) {action};;\nesac\n'
                        f'exec {PROGRAM} "$@"')


RULE_BREAKERS = {
    "a wrong status": (f"{PROGRAM} \"$@\"; exit 0", "exit status: predicted 2, found 0"),
    "a real crash": ("kill -SEGV $$", "predicted 2, found none: assay crashed with signal 11"),
    "a missing line": (f"{PROGRAM} \"$@\" | sed '$d'; exit 2", "    + (the end)"),
    "an extra line": (f"{PROGRAM} \"$@\"; echo NumGLGPUs=1; exit 2", "    + NumGLGPUs=1"),
    "another order": (f"{PROGRAM} \"$@\" | sed '$!{{h;d}};G'; exit 2", "report (- predicted"),
    "another message": ("echo exception: other >&2; exec " + str(PROGRAM) + ' "$@"',
                    "    + exception: other"),
    "no failure": (f"exec {PROGRAM}", "exit status: predicted 2, found 0"),
    "no end": ('touch "$ASSAY_TEST_CUE"; sleep 1000000', f"did not end within {TIMEOUT} s"),
}


@pytest.mark.parametrize("name", RULE_BREAKERS)
def test_first_outcome_that_is_not_predicted(host, tmp_path, name):
    action, shown = RULE_BREAKERS[name]
    child = wrapped(tmp_path, "-crashAfter=5", action)
    environment = host.environment(script=Gpu().script(), opencl="absent")
    run = torture({**environment, **Cue(tmp_path).variables}, "--timeout", str(TIMEOUT), assay=child)
    assert run.status == 1
    assert "\n-crashAfter=5 differs from its prediction:\n" in run.text
    assert shown in run.text
    assert run.text.endswith(f"  command: {child} -crashAfter=5\n")


def test_failing_undisturbed_run(host, tmp_path):
    environment = host.environment(script=Gpu().script(), opencl="absent")
    run = torture(environment, assay="/bin/true")
    assert run.status == 1
    assert run.text.startswith("The runs can't be predicted: the undisturbed run did not complete")
    run = torture(environment, assay=script_child(tmp_path, f'{PROGRAM} "$@" | grep -v GLVendor='))
    assert run.status == 1
    assert "The runs can't be predicted: the report has no line for glgpu[0].GLVendor" in run.text
    run = torture(environment, assay=tmp_path / "missing")
    assert run.status == 5
    assert "there is no file" in run.text


def test_interrupt(host, tmp_path):
    child = wrapped(tmp_path, "-crashAfter=5", f"touch {tmp_path}/there; sleep 1000000")
    with Watched("torture", "--assay", child,
                 environment=host.environment(script=Gpu().script(), opencl="absent")) as watched:
        until((tmp_path / "there").exists, "the run doesn't come")
        watched.process.send_signal(signal.SIGINT)
        run = watched.finish()
    assert run.status == 6
    assert run.text.endswith("\nInterrupted at -crashAfter=5.\n")


def test_interrupt_of_the_undisturbed_run(tmp_path):
    child = script_child(tmp_path, "exec sleep 1000000")
    control, terminal = pty.openpty()
    with Watched("torture", "--assay", child, stderr=terminal) as watched:
        os.close(terminal)
        shown = b""
        while b"\ran undisturbed run" not in shown:
            assert select.select([control], [], [], DEADLINE)[0]
            shown += os.read(control, 65536)
        watched.process.send_signal(signal.SIGINT)
        run = watched.finish()
    os.close(control)
    assert (run.status, run.text) == (6, "The run was interrupted before its first line.\n")


def test_llvmpipe(host):
    run = torture(host.environment(egl="real", opencl="empty"))
    if run.text.startswith("0 OpenGL"):
        pytest.skip("no OpenGL driver here")
    assert run.status == 0, run.text


@pytest.mark.parametrize("kind", ["crash", "throw"])
def test_llvmpipe_with_opencl(host, kind):
    if kind == "throw" and not os.environ.get("ASSAY_LONG_TESTS"):
        pytest.skip("takes minutes: set ASSAY_LONG_TESTS=1")
    if shutil.which("clinfo") is None and not os.path.isdir("/etc/OpenCL/vendors"):
        pytest.skip("no OpenCL driver here")
    environment = {**host.environment(egl="real", opencl="real"), "RUSTICL_ENABLE": "llvmpipe",
                   "RUSTICL_DEVICE_TYPE": "gpu"}
    run = torture(environment, "--kind", kind)
    if " and 0 OpenCL" in run.text or " and no OpenCL" in run.text:
        pytest.skip("no OpenCL driver here presents a GPU")
    assert run.status == 0, run.text


def test_progress_on_a_terminal(host):
    control, terminal = pty.openpty()
    with Watched("torture", "--assay", PROGRAM, "--kind", "crash", stderr=terminal,
                 environment=host.environment(script="# nothing\n", opencl="absent"),
                 program=HOST) as watched:
        os.close(terminal)
        run = watched.finish()
    shown = read_to_the_end(control).decode()
    os.close(control)
    assert run.status == 0
    assert "\r-crashAfter=3 of 9" in shown
