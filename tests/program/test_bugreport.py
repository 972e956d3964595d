"""assay-host bugreport: what its archive has, what is masked, and when it is written."""

import os
import pty
import re
import select
import signal
import socket
import stat
import zipfile

import pytest

import test_usable
from calls import FullMachine
from harness import DEADLINE, PROGRAM_AT_ROOT, until
from hosting import (ERROR_STATUS, HOST_ON_CUE, STATUSES, Watched, host_run, host_run_until,
                     script_child, text_of)
from namespaces import Namespace, why_no_namespace
from test_usable import FAILURES, hangs
from validate import validate_document

pytestmark = test_usable.pytestmark

FILES = {
    "README.txt": "what the archive has, and what is missing",
    "summary.txt": "the run as text: what works, and what to do",
    "report.txt": "each line of assay with its log, and standard error",
    "report.json": "the run for programs; assay-host show makes any form of it",
    "system.txt": "versions of the programs, the system and the kernel",
    "adapters.txt": "the system's lists of graphics adapters",
    "drivers.txt": "the files of the drivers, with their versions",
    "kernel.txt": "messages of the kernel about graphics",
}
NO_NAMESPACE = why_no_namespace()
CHILD = "echo 'Tester=\"Pixmere\"'"


class Archive:
    """The files of an archive; all are in one folder."""

    def __init__(self, path):
        with zipfile.ZipFile(path) as archive:
            assert archive.testzip() is None
            names = archive.namelist()
            folders = {name.split("/")[0] for name in names}
            assert len(folders) == 1
            self.folder = folders.pop()
            self.names = [name.split("/", 1)[1] for name in names]
            self.bytes = {name.split("/", 1)[1]: archive.read(name) for name in names}
            self.modes = {stat.filemode(entry.external_attr >> 16) for entry in archive.infolist()}

    def text(self, name):
        return self.bytes[name].decode()

    def document(self):
        return validate_document(self.bytes["report.json"])

    def missing(self):
        """What README.txt says of each missing thing, by its file."""
        part = self.text("README.txt").split("\nMissing:\n")[1].split("\n\n")[0]
        return {} if part == "nothing" else dict(line.split(None, 1) for line in part.splitlines())


def announcement(path):
    """What is printed before anything is done."""
    return (f"{path} will have:\n" + "".join(f"  {name:<12}  {what}\n" for name, what in FILES.items())
            + "The names of this machine and of its user and the paths of home folders are masked.\n")


def bugreport(folder, *options, child=CHILD, **more):
    path = folder / "report.zip"
    run = host_run("bugreport", "--assay", str(script_child(folder, child)), "--output", str(path),
                   "--yes", *options, **more)
    return run, path


def run_machine(folder, failure, **variables):
    """The archive of a machine with scripted drivers."""
    path = folder / "report.zip"
    host, found = FullMachine(folder).host("run", failure.gl, failure.cl)
    environment = {**host.environment(**found), **variables}
    run = host_run("bugreport", "--assay", str(PROGRAM_AT_ROOT), "--output", str(path), "--yes",
                   environment=environment)
    assert run.status == 0, run.err
    return run, Archive(path)


def test_what_an_archive_has(tmp_path):
    run, archive = run_machine(tmp_path, FAILURES["none"])
    assert archive.names == list(FILES)
    assert re.fullmatch(r"assay-bugreport-\d{8}T\d{6}Z", archive.folder)
    assert archive.modes == {"-rw-r--r--"}
    document = archive.document()
    assert document["outcome"]["verdict"] == "complete"
    assert document["drivers"]["known"]
    lines = archive.text("report.txt").splitlines()
    assert [line for line in lines if not line.startswith("#")] == [
        text_of(line["text"].encode()) for line in document["lines"] if line["kind"] == "value"]
    assert any("loaded for OpenGL: " in line for line in lines)
    assert any("BEGIN GPUImplHardware::DoGetCLBandwidth" in line for line in lines)
    assert "Run: all tests ran" in archive.text("summary.txt")
    assert "wmiNumDevices=1" in archive.text("adapters.txt")
    for file in document["drivers"]["files"]:
        assert f"{file['interface']} {file['path']}\n" in archive.text("drivers.txt")
    assert document["versions"]["assay-host"]["value"] in archive.text("system.txt")
    assert not document["environment"]["host"]["known"]
    assert any(file["buildId"]["known"] for file in document["drivers"]["files"])
    for name in FILES:
        assert archive.bytes[name]
        if name != "README.txt":
            assert f"\n{name} " in archive.text("README.txt")
    # The files are listed before the run, and with their sizes afterwards.
    missing = archive.missing()
    path = tmp_path / "report.zip"
    assert run.text == announcement(path) + f"{path} was written:\n" + "".join(
        f"  {name:<12}  {len(archive.bytes[name])} bytes"
        + (f"; not known: {missing[name]}\n" if name in missing else "\n") for name in FILES)


def test_the_kernel_log_is_there_or_has_its_reason(tmp_path):
    _, path = bugreport(tmp_path)
    archive = Archive(path)
    reason = archive.missing().get("kernel.txt")
    if reason is not None:
        assert reason.startswith("/dev/kmsg: ")
        assert archive.text("kernel.txt") == f"not known ({reason})\n"
    else:
        assert "not known" not in archive.text("kernel.txt")


@pytest.mark.skipif(NO_NAMESPACE is not None, reason=str(NO_NAMESPACE))
def test_the_kernel_messages_of_the_run(tmp_path):
    """The child causes them: they are read after its end."""
    with Namespace() as space:
        log = tmp_path / "log"
        log.touch()
        space.cover("/dev/kmsg", log)
        child = script_child(tmp_path, f"echo '6,1,2000000,-;amdgpu: ring gfx timeout' > {log}")
        path = tmp_path / "report.zip"
        run = host_run(*space.around[1:], HOST_ON_CUE, "bugreport", "--assay", child, "--output", path,
                       "--yes", program=space.around[0])
    assert run.status == 0
    assert "amdgpu: ring gfx timeout" in Archive(path).text("kernel.txt")


@pytest.mark.parametrize("name", ["crash in the compiler", "crash in the copy",
                                  "driver exits with 0"])
def test_a_driver_that_ends_assay(tmp_path, name):
    _, archive = run_machine(tmp_path, FAILURES[name])
    outcome = archive.document()["outcome"]
    assert outcome["verdict"] in ("crashed", "failed-tests")
    assert outcome["reason"] in " ".join(archive.text("summary.txt").split())
    assert archive.document()["drivers"]["files"]


def test_a_driver_that_hangs(tmp_path):
    failure = FAILURES["hang in the clear"]
    records = {kind: tmp_path / f"{kind}-record" for kind in ("gl", "cl")}
    host, found = FullMachine(tmp_path).host(
        "run", failure.gl + f"record {records['gl']}\n", f"record {records['cl']}\n")
    path = tmp_path / "report.zip"
    run = host_run_until(lambda: hangs(failure, records), tmp_path, "bugreport", "--assay",
                         str(PROGRAM_AT_ROOT), "--output", str(path), "--yes",
                         environment=host.environment(**found))
    assert run.status == 0
    archive = Archive(path)
    assert archive.document()["outcome"]["verdict"] == "hung"
    assert "Run: did not end" in archive.text("summary.txt")


def test_a_child_that_is_not_there(tmp_path):
    path = tmp_path / "report.zip"
    run = host_run("bugreport", "--assay", "/no/such/program", "--output", str(path), "--yes")
    assert run.status == 0
    archive = Archive(path)
    assert archive.document()["versions"]["assay"] == {"known": False, "reason": "its file can't be read"}
    missing = archive.missing()
    assert missing["report.txt"] == "assay printed nothing"
    assert missing["drivers.txt"] == "the child was not started"


def test_names_are_masked(tmp_path):
    home = tmp_path / "nested" / "somebody"
    home.mkdir(parents=True)
    machine = socket.gethostname()
    private = f"Card of Zaphod on {machine} in {home}/driver"
    failure = test_usable.Failure(gl=f'string GL_RENDERER "{private}"\n')
    run, archive = run_machine(tmp_path, failure, USER="zaphod", LOGNAME="zaphod", HOME=str(home))
    assert archive.document()["devices"][0]["keys"]["GLRenderer"]["value"] == (
        f"Card of USER on {'HOST' if machine != 'localhost' else machine} in HOME/driver")
    for name in FILES:
        text = archive.text(name).lower()
        assert "zaphod" not in text
        assert str(home) not in text
        if machine != "localhost":
            assert not re.search(rf"(?<!\w){re.escape(machine.lower())}(?!\w)", text)
    assert private not in run.text


def test_the_usual_name(tmp_path):
    run = host_run("bugreport", "--assay", str(script_child(tmp_path, CHILD)), "--yes", cwd=tmp_path)
    assert run.status == 0
    files = [file for file in tmp_path.iterdir() if file.name != "child"]
    assert [re.sub(r"\d", "0", file.name) for file in files] == ["assay-bugreport-00000000T000000Z.zip"]
    assert Archive(files[0]).folder == files[0].stem


def test_a_file_is_not_replaced(tmp_path):
    target = tmp_path / "report.zip"
    target.write_text("mine")
    ran = tmp_path / "ran"
    run, _ = bugreport(tmp_path, child=f"touch {ran}")
    assert run.status == ERROR_STATUS
    assert text_of(run.err) == f"assay-host: cannot write {target}: File exists\n"
    assert target.read_text() == "mine"
    assert not ran.exists()
    target.unlink()
    target.symlink_to(tmp_path / "nowhere")
    assert bugreport(tmp_path)[0].status == ERROR_STATUS
    assert not (tmp_path / "nowhere").exists()


def test_a_file_that_comes_during_the_run_stays(tmp_path):
    target = tmp_path / "report.zip"
    run, _ = bugreport(tmp_path, child=f"echo mine > {target}")
    assert run.status == ERROR_STATUS
    assert text_of(run.err) == f"assay-host: cannot write {target}: File exists\n"
    assert target.read_text() == "mine\n"
    assert sorted(file.name for file in tmp_path.iterdir()) == ["child", "report.zip"]


def test_nobody_is_asked_without_a_terminal(tmp_path):
    path = tmp_path / "report.zip"
    run = host_run("bugreport", "--assay", str(script_child(tmp_path, CHILD)), "--output", str(path))
    assert run.status == ERROR_STATUS
    assert text_of(run.err) == ("assay-host: standard input is no terminal to ask on; --yes writes the "
                                "archive without asking\n")
    assert run.text == announcement(path)
    assert not path.exists()


@pytest.mark.parametrize("answer, status", [(b"y\n", 0), (b"Y\n", 0), (b"yes\n", 0), (b"n\n", 1),
                                            (b"\n", 1), (b"\x04", 1)])
def test_a_terminal_is_asked(tmp_path, answer, status):
    path = tmp_path / "report.zip"
    control, terminal = pty.openpty()
    with Watched("bugreport", "--assay", str(script_child(tmp_path, CHILD)), "--output", str(path),
                 stdin=terminal) as watched:
        os.close(terminal)
        asked = b""
        while b"[y/N]" not in asked:
            assert select.select([watched.process.stderr], [], [], DEADLINE)[0]
            asked += os.read(watched.process.stderr.fileno(), 4096)
        assert asked == b"Write it? [y/N] "
        os.write(control, answer)
        run = watched.finish()
    os.close(control)
    assert run.status == status
    assert path.exists() == (status == 0)
    if status:
        assert run.text == announcement(path) + "Nothing was written.\n"


def test_an_interrupt_writes_nothing(tmp_path):
    path = tmp_path / "report.zip"
    child = script_child(tmp_path, f"touch {tmp_path}/there; exec sleep 1000000")
    with Watched("bugreport", "--assay", child, "--output", path, "--yes", "--timeout", "0") as watched:
        until((tmp_path / "there").exists, "the child doesn't start")
        watched.process.send_signal(signal.SIGTERM)
        run = watched.finish()
    assert (run.status, run.text, run.err) == (STATUSES["interrupted"], announcement(path), b"")
    assert sorted(file.name for file in tmp_path.iterdir()) == ["child", "there"]
