"""The units for systemd: what systemd-analyze finds in them, and a run where a systemd manages the machine."""

import json
import os
import re
import shutil
import tempfile
from pathlib import Path

import pytest

from engines import INTEGRATIONS, needed, outcome_of
from harness import PROGRAM, TREE
from hosting import HOST, host_run, validate_document

UNITS = INTEGRATIONS / "systemd"
COMMANDS = re.findall(r"^ExecStart=(.*)$", (UNITS / "assay.service").read_text(), re.MULTILINE)


@pytest.fixture(name="units")
def fixture_units(tmp_path):
    """The units with the program of this build."""
    for name in ("assay.service", "assay.timer"):
        text = (UNITS / name).read_text(encoding="utf-8").replace("/usr/bin/assay-host", str(HOST))
        # The man pages of this build aren't installed.
        text = re.sub("^Documentation=.*\n", "", text, flags=re.MULTILINE)
        (tmp_path / name).write_text(text, encoding="utf-8")
    return tmp_path


def test_units_are_valid(units):
    analyze = needed("systemd-analyze")
    assert outcome_of(analyze, "verify", units / "assay.service", units / "assay.timer") == (0, "")
    bad = units / "assay.service"
    bad.write_text(bad.read_text().replace("NoNewPrivileges=yes", "NoNewPrivilege=yes"))
    assert "NoNewPrivilege" in outcome_of(analyze, "verify", bad)[1]


def test_service_is_hardened(units):
    status, text = outcome_of(needed("systemd-analyze"), "security", "--offline=true",
                              "--threshold=30", "--no-pager", units / "assay.service")
    assert status == 0, text
    for setting in ("NoNewPrivileges=", "ProtectSystem=", "PrivateTmp=", "PrivateNetwork=",
                    "CapabilityBoundingSet=~CAP_SYS_ADMIN"):
        assert re.search(f"✓ {re.escape(setting)}", text), text


def test_commands_make_the_files(tmp_path):
    """The same commands with another folder."""
    statuses = []
    for command in COMMANDS:
        program, *words = command.replace("/var/lib/assay", str(tmp_path)).split()
        assert program == "/usr/bin/assay-host"
        statuses.append(host_run(*words, program=HOST).status)
    assert statuses == [0, 0, 0, 0]
    document = validate_document((tmp_path / "report.json").read_bytes())
    assert json.loads((tmp_path / "facts.json").read_text())["time"] == document["environment"]["time"]
    assert "assay_run_verdict" in (tmp_path / "assay.prom").read_text()
    assert "assay.verdict=complete" in (tmp_path / "features").read_text()


@pytest.fixture(name="machine")
def fixture_machine():
    """A folder with the units and the programs that the service can see: it has its own /tmp and /home."""
    if os.geteuid() != 0:
        pytest.skip("a systemd in namespaces needs root")
    if not Path("/lib/systemd/systemd").exists():
        pytest.skip("systemd is not installed")
    folder = Path(tempfile.mkdtemp(prefix="assay-systemd-", dir="/srv"))
    folder.chmod(0o755)
    (folder / "out").mkdir()
    shutil.copytree(TREE / "tests" / "engines" / "systemd", folder / "units")
    for file in (folder / "units").iterdir():
        file.write_text(file.read_text().replace("@FOLDER@", str(folder)))
    for program in (HOST, PROGRAM):
        shutil.copy(program, folder)
    service = (UNITS / "assay.service").read_text()
    (folder / "units" / "assay.service").write_text(
        service.replace("/usr/bin/assay-host", str(folder / HOST.name)))
    yield folder
    shutil.rmtree(folder)


def test_service_runs_with_a_systemd(machine):
    unshare = needed("unshare")
    status, text = outcome_of(
        unshare, "--fork", "--pid", "--mount", "--uts", "--ipc", "--cgroup", "--mount-proc", "sh",
        machine / "units" / "boot", machine)
    if "systemd starts" not in text:
        pytest.skip(f"no systemd can run here: {text.strip().splitlines()[-1:]}")
    assert status == 0, text
    found = dict(line.split("=", 1)
                 for line in (machine / "out" / "show").read_text().splitlines() if "=" in line)
    assert (found["Result"], found["NoNewPrivileges"]) == ("success", "yes"), text
    document = validate_document((machine / "out" / "assay" / "report.json").read_bytes())
    assert document["outcome"]["verdict"] == "complete"
    assert sorted(file.name for file in (machine / "out" / "assay").iterdir()) == [
        "assay.prom", "facts.json", "features", "report.json"]
