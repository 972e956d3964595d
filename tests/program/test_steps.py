"""A programmed crash or throw at every step: lines, standard error and status are what the table of
steps predicts, for machines with none, one and two GPUs."""

from concurrent.futures import ThreadPoolExecutor

import pytest

from adapters import Adapter, write_tree
from model import Gpu, check, predict, script_of

WORKERS = 2


def machine(count, folder):
    """The GPUs of a machine, the arguments of Host.run for it, and those of predict."""
    if count == 0:
        # A script without a device: EGL exists and has none.
        return [], {"script": "# nothing\n"}, {"ogl": 0, "context": 0}
    if count == 1:
        gpus = [Gpu()]
        return gpus, {"script": script_of(gpus)}, {}
    adapters = [Adapter(0, "First card"), Adapter(1, "Second card", memory_mb=4096,
                                                  device_id=0x73BF)]
    gpus = [Gpu(renderer="First renderer", adapter=adapters[0]),
            Gpu(renderer="Second renderer", version="4.6 Scripted", extensions=[],
                integers=list(range(1, 10)), adapter=adapters[1])]
    write_tree(folder / "root", adapters)
    return gpus, {"script": script_of(gpus), "root": folder / "root"}, {}


@pytest.mark.parametrize("opencl", ["absent", "empty"])
@pytest.mark.parametrize("count", [0, 1, 2])
def test_number_of_steps(host, tmp_path, count, opencl):
    """The whole run, and how many steps it takes: 9, with 35 more for each GPU and one more with
    OpenCL."""
    gpus, found, checks = machine(count, tmp_path)
    clgpus = None if opencl == "absent" else 0
    expected = predict(gpus, opencl=clgpus, **checks)
    assert expected.steps == 9 + 35 * count + (opencl == "empty")
    assert expected.errors == []
    assert expected.status == 0
    check(host.run(opencl=opencl, **found), expected)


@pytest.mark.parametrize("option", ["crashAfter", "throwAfter"])
@pytest.mark.parametrize("count", [0, 1, 2])
def test_failure_at_every_step(host, tmp_path, count, option):
    gpus, found, checks = machine(count, tmp_path)
    steps = predict(gpus, **checks).steps
    field = {"crashAfter": "crash_after", "throwAfter": "throw_after"}[option]
    # The script is a file that all runs share.
    host.run(**found)
    found["script"] = tmp_path / "script"

    def run_to(step):
        return host.run(f"-{option}={step}", **found)

    with ThreadPoolExecutor(WORKERS) as workers:
        runs = list(workers.map(run_to, range(steps + 1)))
    statuses = []
    for step, run in enumerate(runs):
        expected = predict(gpus, **{field: step}, **checks)
        check(run, expected)
        statuses.append(run.status)
    # A failure at each step has an effect; one after the last step has none.
    assert statuses == [2] * steps + [0]


@pytest.mark.parametrize("option", ["crashAfter", "throwAfter"])
def test_failure_at_the_opencl_steps(host, tmp_path, option):
    """The step of the OpenCL enumeration and those after it."""
    gpus, found, checks = machine(1, tmp_path)
    steps = predict(gpus, opencl=0, **checks).steps
    field = {"crashAfter": "crash_after", "throwAfter": "throw_after"}[option]
    for step in range(steps - 4, steps + 1):
        check(host.run(f"-{option}={step}", opencl="empty", **found),
              predict(gpus, opencl=0, **{field: step}, **checks))


def test_crash_wins_over_throw_at_the_same_step(host, tmp_path):
    gpus, found, checks = machine(1, tmp_path)
    run = host.run("-throwAfter=3", "-crashAfter=3", **found)
    check(run, predict(gpus, crash_after=3, throw_after=3, **checks))
    assert run.errors == ["exception: programmed failure"]


def test_throw_before_the_crash(host, tmp_path):
    """A throw inside a test ends the tests of one GPU; the crash threshold then ends the run."""
    gpus, found, checks = machine(2, tmp_path)
    run = host.run("-throwAfter=9", "-crashAfter=30", **found)
    check(run, predict(gpus, throw_after=9, crash_after=30, **checks))
    assert run.errors == ["exception: Programmed throw", "exception: programmed failure",
                          "exception: programmed failure"]


@pytest.mark.parametrize("value", [-1, 2**31 - 1, 10**9])
def test_thresholds_that_no_run_reaches(host, tmp_path, value):
    gpus, found, checks = machine(1, tmp_path)
    check(host.run(f"-crashAfter={value}", f"-throwAfter={value}", **found),
          predict(gpus, **checks))


def test_requested_status_without_a_failure(host, tmp_path):
    gpus, found, checks = machine(1, tmp_path)
    check(host.run("-exit=7", **found), predict(gpus, exit_status=7, **checks))
    check(host.run("-exit=7", "-throwAfter=10", **found),
          predict(gpus, exit_status=7, throw_after=10, **checks))
