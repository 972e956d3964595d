"""assay-host run --repeat and --for: the statistics of runs whose noise is known, and what differs
between runs."""

import ctypes.util
import json
import os
import pty
import random
import re
import select
import signal
import statistics
from dataclasses import dataclass, replace
from pathlib import Path

import pytest

from clmodel import ClGpu, ClPlatform, cl_script_of
from harness import BUILD, DEADLINE, Host, until
from hosting import (ERROR_STATUS, PROGRAM, Cue, Watched, host_run, script_child, text_of)
from validate import validate_document

pytestmark = pytest.mark.skipif(ctypes.util.find_library("OpenCL") is None,
                                reason="this machine has no OpenCL loader library")

# Each run of this child has the driver's script of its own number; the last one is used again.
CHILD = """
cd "$ASSAY_TEST_SERIES" || exit 99
echo >> runs
run=$(wc -l < runs)
[ -e "before-$run" ] && . "./before-$run"
[ -e "cl-$run" ] && cp "cl-$run" cl
exec "$ASSAY_TEST_PROGRAM" "$@"
"""


@dataclass
class Machine:
    """A machine with OpenCL alone, whose driver changes from run to run."""

    folder: Path

    def environment(self):
        return Host(self.folder, {
            "OCL_ICD_VENDORS": str(BUILD / "drivers" / "opencl"), "OCL_ICD_PLATFORM_SORT": "none",
            "ASSAY_SCRIPTED_OPENCL": str(self.folder / "cl"),
            "ASSAY_TEST_SERIES": str(self.folder), "ASSAY_TEST_PROGRAM": str(PROGRAM),
        }).environment(egl="absent", opencl="empty")

    def set_runs(self, runs):
        """The devices of each run, or the text of its script."""
        (self.folder / "runs").write_text("")
        for number, run in enumerate(runs, 1):
            if isinstance(run, ClGpu):
                run = [run]
            text = run if isinstance(run, str) else cl_script_of([ClPlatform(run)])
            (self.folder / f"cl-{number}").write_text(text)

    def before(self, run, text):
        """Commands of the child before the program in a run."""
        (self.folder / f"before-{run}").write_text(text + "\n")

    def start(self, *options, more=None, **streams):
        child = script_child(self.folder, CHILD)
        return Watched("run", "--assay", str(child), *options,
                       environment={**self.environment(), **(more or {})}, **streams)

    def run(self, *options, more=None):
        with self.start(*options, more=more) as watched:
            return watched.finish()

    def document(self, *options, more=None):
        hosted = self.run("--format", "json", *options, more=more)
        (self.folder / "stored.json").write_bytes(hosted.out)
        return hosted.document()

    @property
    def stored(self):
        return str(self.folder / "stored.json")


@pytest.fixture
def machine(tmp_path):
    return Machine(tmp_path)


def gpu(batch=600_000_000, kernel=250_000_000, **more):
    return ClGpu(batch=batch, kernel=kernel, **more)


def noisy(count, seed, scale=1.0):
    """Runs whose times have noise of 3 %. The first is slow, as if it filled a cache."""
    draw = random.Random(seed)
    runs = [gpu(round(9e8 * scale), round(4e8 * scale))]
    for _ in range(count - 1):
        runs.append(gpu(round(6e8 * scale * (1 + 0.03 * draw.gauss(0, 1))),
                        round(2.5e8 * scale * (1 + 0.03 * draw.gauss(0, 1)))))
    return runs


def printed(device, key):
    """The number that the report of such a device has."""
    return float(device.values(ClPlatform([device]))[key])


def measurement(document, key, device="clgpu[0]"):
    found = [each for each in document["series"]["measurements"]
             if (each["key"], each["device"]) == (key, device)]
    assert len(found) == 1
    return found[0]


def close(found, wanted):
    return found == pytest.approx(wanted, rel=1e-12, abs=0)


def check_statistics(found, samples):
    """The statistics of samples, against Python's."""
    low, middle, high = statistics.quantiles(samples, n=4, method="inclusive")
    assert found["known"] is True
    assert found["count"] == len(samples)
    assert (found["minimum"], found["maximum"]) == (min(samples), max(samples))
    assert close(found["median"], statistics.median(samples))
    assert close(found["median"], middle)
    assert close(found["lowerQuartile"], low)
    assert close(found["upperQuartile"], high)
    # Differences of close numbers lose digits.
    assert found["spread"] == pytest.approx(high - low, rel=1e-9, abs=0)
    assert found["relativeSpread"] == pytest.approx((high - low) / middle, rel=1e-9, abs=0)
    assert close(found["lowerFence"], low - 1.5 * (high - low))
    assert close(found["upperFence"], high + 1.5 * (high - low))


def findings(document):
    return [(each["code"], each["device"], each["text"]) for each in document["series"]["findings"]]


def test_the_statistics_are_those_of_the_runs(machine):
    runs = noisy(30, 1)
    runs[11] = gpu(2_000_000_000, runs[11].kernel)
    machine.set_runs(runs)
    document = machine.document("--repeat", "30")
    series = document["series"]
    assert (series["repeat"], series["forSeconds"], series["runs"]) == (30, None, 30)
    assert (series["end"], series["shown"]) == ("done", 1)
    assert series["verdicts"] == [{"verdict": "complete", "runs": 30}]
    assert findings(document) == []
    for key in ("CLBandwidth", "CLCompute"):
        found = measurement(document, key)
        wanted = [printed(device, key) for device in runs]
        assert [each["run"] for each in found["samples"]] == list(range(1, 31))
        assert [each["number"] for each in found["samples"]] == wanted
        assert found["first"] == wanted[0]
        check_statistics(found["statistics"], wanted[1:])
    outliers = measurement(document, "CLBandwidth")["statistics"]["outliers"]
    assert {"run": 12, "number": printed(runs[11], "CLBandwidth")} in outliers
    times = measurement(document, "seconds", None)
    check_statistics(times["statistics"], [each["number"] for each in times["samples"][1:]])


def test_every_form_has_the_medians(machine):
    runs = [gpu(kernel=kernel) for kernel in (10**9, 250_000_000, 500_000_000, 200_000_000)]
    machine.set_runs(runs)
    document = machine.document("--repeat", "4")
    median = statistics.median(printed(device, "CLCompute") for device in runs[1:])
    assert measurement(document, "CLCompute")["statistics"]["median"] == median == 32
    # The lines are those of the run that is shown.
    assert document["devices"][0]["keys"]["CLCompute"]["number"] == 8

    def show(form):
        shown = host_run("show", "--format", form, machine.stored)
        assert shown.status == 0
        return shown.text

    assert re.search(r'^assay_\w*compute_score\{.*\} 32$', show("prometheus"), re.MULTILINE)
    assert re.search(r'"compute_score":32[,.}]', show("ansible"))
    text = show("text")
    assert re.search(r"^  Compute score +32 ", text, re.MULTILINE)
    assert re.search(r"^  Median +32 \(3 runs\)$", text, re.MULTILINE)
    assert re.search(r"^  First run +8$", text, re.MULTILINE)
    page = show("html")
    assert "<dd>32 (3 runs)</dd>" in page
    assert page.count('role="img"') == 3
    assert show("json").encode() == Path(machine.stored).read_bytes()
    first = host_run("show", "--format", "json", "--schema", "1", machine.stored)
    assert "series" not in validate_document(first.out)
    # The same forms from the run itself.
    for form in ("prometheus", "ansible", "nfd"):
        machine.set_runs(runs)
        drop = re.compile(r".*(timestamp|duration|seconds|time).*\n")
        assert drop.sub("", machine.run("--repeat", "4", "--format", form).text) == drop.sub(
            "", show(form))


def test_check_uses_the_median(machine):
    machine.set_runs([gpu(kernel=kernel) for kernel in (10**9, 10**9, 250_000_000, 250_000_000)])
    machine.document("--repeat", "4")
    for requirement, status in (("CLCompute>=32", 0), ("CLCompute<32", 7)):
        assert host_run("check", "--require", requirement, machine.stored).status == status


def diff(machine, *options):
    compared = host_run("diff", *options, str(machine.folder / "a.json"), str(machine.folder / "b.json"))
    return compared.status, compared.text.splitlines()


def store(machine, name, runs):
    machine.set_runs(runs)
    hosted = machine.run("--repeat", str(len(runs)), "--format", "json")
    (machine.folder / f"{name}.json").write_bytes(hosted.out)
    return hosted.document()


LINE = re.compile(r"clgpu\[0\]\.(\w+): (no change: )?(\S+) (?:and|->) (\S+) \((\S+) %, ([\w ]+); medians of "
                  r"(\d+) and (\d+) runs; Mann-Whitney U test, (exact|normal approximation): p = (\S+)\)")


def test_a_difference_within_the_noise_is_no_change(machine):
    before, after = (store(machine, name, noisy(10, seed)) for name, seed in (("a", 1), ("b", 2)))
    status, lines = diff(machine)
    assert status == 0
    assert [LINE.fullmatch(line).group(1, 2, 6, 7, 8, 9) for line in lines] == [
        (key, "no change: ", "within the noise", "9", "9", "exact") for key in ("CLBandwidth", "CLCompute")]
    for line, key in zip(lines, ("CLBandwidth", "CLCompute")):
        found = LINE.fullmatch(line)
        for document, text in ((before, found[3]), (after, found[4])):
            assert float(text) == pytest.approx(measurement(document, key)["statistics"]["median"])


def test_a_difference_larger_than_the_noise_is_a_change(machine):
    store(machine, "a", noisy(10, 1))
    store(machine, "b", noisy(10, 2, 1.2))
    status, lines = diff(machine)
    assert status == 1
    assert [LINE.fullmatch(line).group(1, 2, 6) for line in lines] == [
        (key, None, "larger than the noise") for key in ("CLBandwidth", "CLCompute")]
    assert all(float(LINE.fullmatch(line)[10]) <= 0.01 for line in lines)
    # A tolerance that is asked for holds too.
    status, lines = diff(machine, "--tolerance", "0.5")
    assert status == 0
    assert [LINE.fullmatch(line)[6] for line in lines] == ["within the tolerance"] * 2


def test_too_few_runs_tell_nothing(machine):
    store(machine, "a", noisy(5, 1))
    store(machine, "b", noisy(5, 2, 2))
    status, lines = diff(machine)
    assert status == 0
    assert [line.split("(", 1)[1] for line in lines] == [
        "medians of 4 and 4 runs; too few to tell a change from noise, which takes 5 each)"] * 2


def test_a_series_and_a_single_run(machine):
    store(machine, "a", [gpu(kernel=10**9), gpu(), gpu()])
    machine.set_runs([gpu()])
    (machine.folder / "b.json").write_bytes(machine.run("--format", "json").out)
    assert diff(machine) == (0, [])


def test_facts_that_change_are_findings(machine):
    machine.set_runs([gpu(memory=(3 if run in (3, 7) else 4) << 30) for run in range(1, 11)])
    document = machine.document("--repeat", "10")
    assert findings(document) == [
        ("fact-changed", "clgpu[0]",
         "CLMemoryMB differed in 2 of 10 runs: 4096 (8 runs), 3072 (runs 3, 7)")]
    assert document["series"]["findings"][0]["runs"] == [3, 7]
    shown = host_run("show", machine.stored).text
    assert "! " in shown and "CLMemoryMB differed in 2 of 10 runs" in " ".join(shown.split())
    assert "CLMemoryMB differed in 2 of 10 runs" in host_run("show", "--format", "html",
                                                             machine.stored).text


def test_a_crash_in_the_middle_does_not_end_the_series(machine):
    good = cl_script_of([ClPlatform([gpu()])])
    machine.set_runs([good, good, good + "at clEnqueueNDRangeKernel crash\n", good, good])
    document = machine.document("--repeat", "5")
    series = document["series"]
    assert (document["outcome"]["verdict"], document["outcome"]["status"]) == ("crashed", 3)
    assert (series["shown"], series["runs"], series["end"]) == (3, 5, "done")
    assert series["verdicts"] == [{"verdict": "complete", "runs": 4},
                                  {"verdict": "crashed", "runs": 1}]
    assert document["usable"]["opencl"]["answer"] == series["usable"]["opencl"] == "broken"
    texts = [text for _, _, text in findings(document)]
    assert texts[0].startswith("crashed in 1 of 5 runs (run 3): ")
    assert texts[1] == "the answer for OpenCL differed in 1 of 5 runs: hardware (runs 1, 2, 4, 5), broken (run 3)"
    found = measurement(document, "CLCompute")
    assert found["samples"][2] == {"run": 3, "known": False, "value": None,
                                   "reason": "run ended before"}
    assert found["statistics"]["count"] == 3
    assert measurement(document, "CLBandwidth")["samples"][2]["known"]


def test_a_need_is_that_of_the_worst_run(machine):
    good = cl_script_of([ClPlatform([gpu()])])
    machine.set_runs([good, good + "at clEnqueueNDRangeKernel crash\n", good])
    assert machine.run("--repeat", "3", "--need", "opencl").status == 21
    machine.set_runs([good, good, good])
    assert machine.run("--repeat", "3", "--need", "opencl").status == 0


def test_a_run_that_hangs_does_not_end_the_series(machine):
    good = cl_script_of([ClPlatform([gpu()])])
    machine.set_runs([good, good + "at clEnqueueNDRangeKernel hang\n", good])
    cue = Cue(machine.folder)
    # The timeout passes in the second run alone.
    machine.before(2, 'touch "$ASSAY_TEST_CUE"')
    machine.before(3, 'rm "$ASSAY_TEST_CUE"')
    document = machine.document("--repeat", "3", "--timeout", "1200", more=cue.variables)
    assert document["series"]["verdicts"] == [{"verdict": "complete", "runs": 2},
                                              {"verdict": "hung", "runs": 1}]
    assert document["series"]["shown"] == 2


def test_what_is_not_measured_is_no_number(machine):
    machine.set_runs([gpu(), gpu(kernel=0), gpu(), gpu(batch=1), gpu()])
    document = machine.document("--repeat", "5")
    score = measurement(document, "CLCompute")
    assert score["samples"][1] == {"run": 2, "known": False, "value": "0",
                                   "reason": "the device's clock reported no elapsed time"}
    assert (score["statistics"]["count"], score["statistics"]["minimum"]) == (3, 32)
    speed = measurement(document, "CLBandwidth")
    assert speed["samples"][3]["reason"] == "the device's clock is unreliable"
    assert (speed["statistics"]["count"], speed["statistics"]["maximum"]) == (3, printed(gpu(), "CLBandwidth"))
    assert [code for code, _, _ in findings(document)] == ["not-measured", "not-measured"]


def test_devices_that_change_places_keep_their_samples(machine):
    first, second = gpu(name="First"), gpu(name="Second", kernel=500_000_000)
    machine.set_runs([[first, second], [second, first], [first, second]])
    document = machine.document("--repeat", "3")
    assert {code for code, _, _ in findings(document)} == {"device-moved"}
    assert {each["number"] for each in measurement(document, "CLCompute")["samples"]} == {32}
    assert {each["number"] for each in measurement(document, "CLCompute", "clgpu[1]")["samples"]} == {16}


def test_for_a_time(machine):
    machine.set_runs([gpu()])
    cue = Cue(machine.folder)
    # The clock is an hour ahead after that.
    machine.before(3, 'touch "$ASSAY_TEST_CUE"')
    document = machine.document("--for", "1800", more=cue.variables)
    series = document["series"]
    assert (series["repeat"], series["forSeconds"], series["runs"]) == (None, 1800, 3)
    assert series["seconds"] > 1800
    assert document["outcome"]["verdict"] == "complete"


def test_at_least_one_run(machine):
    machine.set_runs([gpu()])
    document = machine.document("--for", "0.000001")
    assert document["series"]["runs"] == 1
    assert measurement(document, "CLCompute")["statistics"] == {
        "known": False, "reason": "no run after the first has a known sample"}
    assert measurement(document, "CLCompute")["first"] == 32


def test_an_interrupt_keeps_the_runs_before(machine):
    machine.set_runs([gpu()])
    machine.before(3, "touch third; exec sleep 1000000")
    with machine.start("--repeat", "10", "--format", "json") as watched:
        until((machine.folder / "third").exists, "the third run doesn't start")
        watched.process.send_signal(signal.SIGINT)
        hosted = watched.finish()
    document = hosted.document()
    assert (hosted.status, document["outcome"]["verdict"]) == (6, "interrupted")
    assert document["outcome"]["reason"] == "The series was interrupted in or after its run 3."
    series = document["series"]
    assert (series["end"], series["runs"], series["shown"]) == ("interrupted", 3, 1)
    assert measurement(document, "CLCompute")["statistics"]["count"] == 1
    assert document["report"]["whole"]


def test_what_can_not_run_is_not_repeated(machine):
    document = host_run("run", "--assay", "/no/such/program", "--repeat", "5", "--format",
                        "json").document()
    assert (document["outcome"]["verdict"], document["series"]["end"]) == ("never-started", "given-up")
    assert document["series"]["runs"] == 1
    machine.set_runs([gpu()])
    child = script_child(machine.folder, CHILD)
    refused = host_run("run", "--assay", str(child), "--repeat", "5", "--format", "json", "--", "-x=1",
                       environment=machine.environment()).document()
    assert (refused["outcome"]["verdict"], refused["series"]["runs"]) == ("usage-error", 1)


def test_raw_lines_of_all_runs_come_first(machine):
    machine.set_runs([gpu()])
    machine.before(2, "echo aside >&2")
    hosted = machine.run("--repeat", "3", "--raw")
    raw, table = hosted.text.split("\n\n", 1)
    assert [line.split("=")[0] for line in raw.splitlines()
            if line.startswith("assay")] == ["assayStart", "assayEnd"] * 3
    assert "\nRun: all tests ran" in table
    assert hosted.err == b"aside\n"
    machine.set_runs([gpu()])
    assert machine.run("--repeat", "3").err == b""


def test_the_files_of_the_drivers_are_described(machine):
    machine.set_runs([gpu()])
    files = machine.document("--repeat", "2")["drivers"]["files"]
    assert files == machine.document()["drivers"]["files"]
    assert any(file["buildId"]["known"] for file in files)


# What the child has printed when it hangs, and the progress that is shown then.
PROGRESS = {
    "nothing": ("", r"run 2 of 3, about \d+ \w+ left; starting \(Tester\)"),
    "all": ("echo 'assayEnd=\"x\"'", r"run 2 of 3, about \d+ \w+ left; at the end"),
}


@pytest.mark.parametrize("name", PROGRESS)
def test_progress_on_a_terminal(machine, name):
    printed, progress = PROGRESS[name]
    machine.set_runs([gpu()])
    machine.before(2, f"{printed}\nexec sleep 1000000")
    control, terminal = pty.openpty()
    with machine.start("--repeat", "3", stderr=terminal) as watched:
        os.close(terminal)
        shown = ""
        while not re.search(rf"\r{progress}", shown):
            assert select.select([control], [], [], DEADLINE)[0]
            shown += os.read(control, 65536).decode()
        watched.process.send_signal(signal.SIGTERM)
        watched.finish()
    os.close(control)


def test_the_output_can_not_be_written(machine):
    machine.set_runs([gpu()])
    hosted = machine.run("--repeat", "2", "--output", str(machine.folder / "no" / "file"))
    assert hosted.status == ERROR_STATUS
    assert text_of(hosted.err).startswith("assay-host: cannot write ")


def mesa_environment(host):
    return replace(host, variables={"RUSTICL_ENABLE": "llvmpipe", "RUSTICL_DEVICE_TYPE": "gpu"}
                   ).environment(egl="absent", opencl="real")


@pytest.mark.skipif(not Path("/etc/OpenCL/vendors/rusticl.icd").exists(),
                    reason="Mesa's OpenCL driver is not installed")
def test_a_real_driver(tmp_path):
    """Thirty runs only with ASSAY_LONG_TESTS=1. The counters of Mesa's driver say what it likes."""
    runs = 30 if os.environ.get("ASSAY_LONG_TESTS") == "1" else 3
    hosted = host_run("run", "--assay", str(PROGRAM), "--repeat", str(runs), "--format", "json",
                      environment=mesa_environment(Host(tmp_path)))
    document = hosted.document()
    assert document["outcome"]["verdict"] == "complete"
    assert document["series"]["runs"] == runs
    for found in document["series"]["measurements"]:
        assert [each["run"] for each in found["samples"]] == list(range(1, runs + 1))
        known = [each["number"] for each in found["samples"][1:] if each["known"]]
        if len(known) > 1:
            check_statistics(found["statistics"], known)
        for each in found["samples"]:
            if not each["known"]:
                assert each["reason"].startswith("the device's clock ")
    times = measurement(document, "seconds", None)
    assert len([each for each in times["samples"] if each["known"]]) == runs
    json.dumps(document, allow_nan=False)
