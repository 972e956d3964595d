"""The health check of Slurm: what it decides, and what slurmctld and slurmd of one machine make of it."""

import os
import re
import shlex
import shutil
import signal
import socket
import subprocess
import tempfile
from pathlib import Path

import pytest

from engines import INTEGRATIONS, Server, needed, outcome_of
from harness import TREE, until
from hosting import HOST, processes_with
from model import Gpu

DOCS = TREE / "docs" / "fleet.md"
SCRIPT = INTEGRATIONS / "slurm" / "assay-health"
REQUIREMENT = '{"require": ["all CanCompileProgramGLSL==1"]}'

CONFIGURATION = """\
ClusterName=test
SlurmctldHost={host}(127.0.0.1)
SlurmctldPort={ports[0]}
SlurmdPort={ports[1]}
SlurmUser=root
AuthType=auth/munge
AuthInfo=socket={folder}/munge.socket
CommunicationParameters=NoInAddrAny,NoCtldInAddrAny
ProctrackType=proctrack/linuxproc
TaskPlugin=task/none
MpiDefault=none
SelectType=select/cons_tres
StateSaveLocation={folder}/state
SlurmdSpoolDir={folder}/spool
SlurmctldPidFile={folder}/slurmctld.pid
SlurmdPidFile={folder}/slurmd.pid
SchedulerParameters=sched_interval=1
{uses}
NodeName=machine NodeHostname={host} NodeAddr=127.0.0.1 CPUs=1 RealMemory=100 State=UNKNOWN
PartitionName=all Nodes=ALL Default=YES State=UP MaxTime=INFINITE
"""

HEALTH_CHECK = "HealthCheckProgram={folder}/health\nHealthCheckInterval=1\nHealthCheckNodeState=IDLE"
PROLOG = "Prolog={folder}/health"


def write_program(path, text):
    path.write_text("#!/bin/sh\n" + text, encoding="utf-8")
    path.chmod(0o755)
    return path


class Stage:
    """The health check with a check and an scontrol that are scripts."""

    def __init__(self, folder):
        self.folder = folder
        self.calls = folder / "calls"

    def run(self, status, output, node, job=False):
        """Returns the exit status, and the changes of the node."""
        return self.run_host(f"echo {shlex.quote(output)}\nexit {status}\n", node, job)

    def run_host(self, host, node, job=False):
        """The same with a check that is any script."""
        self.calls.write_text("")
        write_program(self.folder / "assay-host", host)
        write_program(self.folder / "scontrol", f"""\
if [ "$2" = show ]; then
    {'exit 1' if node is None else 'printf "%s" ' + shlex.quote(node)}
else
    printf '%s|' "$@" >>{shlex.quote(str(self.calls))}
fi
""")
        write_program(self.folder / "logger", "exit 0\n")
        settings = self.folder / "settings"
        settings.write_text(f"PATH={self.folder}:$PATH\nASSAY_HOST={self.folder}/assay-host\n")
        environment = {"ASSAY_SETTINGS": str(settings), "SLURMD_NODENAME": "n1"}
        if job:
            environment["SLURM_JOB_ID"] = "7"
        ended, _ = outcome_of(SCRIPT, env=environment)
        return ended, self.calls.read_text()


NODE = "NodeName=n1 CPUAlloc=0 State={} ThreadsPerCore=1 CfgTRES=cpu=1{}\n"
IDLE = NODE.format("IDLE", "")
OURS = NODE.format("IDLE+DRAIN", " Reason=assay: crashed: x [root@2026-11-22T11:17:27]")
OTHERS = NODE.format("IDLE+DRAIN", " Reason=new disk, see assay: 7 [root@2026-11-22T11:17:27]")
DOWN = NODE.format("DOWN*", " Reason=Not responding [slurm@2026-11-22T11:17:27]")
DRAIN = "update|NodeName=n1|State=DRAIN|Reason=assay: {}|".format
RESUME = "update|NodeName=n1|State=RESUME|"


@pytest.mark.parametrize("status, output, node, change", [
    (0, "met: the requirement", IDLE, ""),
    (0, "met: the requirement", OURS, RESUME),
    (0, "met: the requirement", OTHERS, ""),
    (0, "met: the requirement", DOWN, ""),
    (7, "not met: GLVersion>=9: glgpu[0] 4.1\nnot met: x", IDLE,
     DRAIN("not met: GLVersion>=9: glgpu[0] 4.1")),
    (3, "crashed: x", OURS, ""),
    (3, "crashed: y", OURS, DRAIN("crashed: y")),
    (4, "hung: x", OTHERS, ""),
    (4, "hung: x", DOWN, DRAIN("hung: x")),
    (7, "not met: GLName==\"a 'b'\": " + "x" * 999, IDLE,
     DRAIN(("not met: GLName==a b: " + "x" * 999)[:200])),
    (124, "", IDLE, DRAIN("the check did not end within 38 s")),
    (1, "failed-tests: x", IDLE, DRAIN("failed-tests: x")),
    (2, "usage-error: x", IDLE, ""),
    (5, "never-started: x", IDLE, ""),
    (6, "interrupted: x", OURS, ""),
    (10, "assay-host: /etc/assay/requirements.json: cannot be opened", IDLE, ""),
    (3, "crashed: x", None, ""),
], ids=str)
def test_decisions(tmp_path, status, output, node, change):
    stage = Stage(tmp_path)
    assert stage.run(status, output, node) == (0, change)
    is_bad = status in (1, 3, 4, 7, 124)
    assert stage.run(status, output, node, job=True) == (int(is_bad), change)


def test_check_that_does_not_end_is_killed(tmp_path):
    """It ignores SIGTERM too. Its limits are shorter than those of the script."""
    stage = Stage(tmp_path)
    write_program(tmp_path / "timeout", """\
case $4 in *assay-host) set -- -k 0.1 0.1 "$4" ;; esac
exec /usr/bin/timeout "$@"
""")
    assert stage.run_host("trap '' TERM\nwhile :; do sleep 0.1; done\n", IDLE) == (
        0, DRAIN("the check did not end within 38 s"))


def test_process_that_is_left_behind_is_not_waited_for(tmp_path):
    stage = Stage(tmp_path)
    left = tmp_path / "left"
    try:
        assert stage.run_host(f"sleep infinity & echo $! >{left}\necho crashed: x\nexit 3\n", IDLE) == (
            0, DRAIN("crashed: x"))
    finally:
        os.kill(int(left.read_text()), signal.SIGKILL)


def test_limits_add_up_to_less_than_a_minute():
    limits = re.findall(r"timeout -k (\d+) (\d+)", SCRIPT.read_text(encoding="utf-8"))
    check, show, *changes = [int(kill) + int(end) for kill, end in limits]
    assert len(changes) == 2 and changes[0] == changes[1] # one of both
    assert check + show + changes[0] == 52


def test_script_passes_shellcheck():
    status, text = outcome_of(needed("shellcheck"), SCRIPT)
    assert (status, text) == (0, "")


class Cluster:
    """slurmctld, slurmd and munged of one machine, on the loopback address."""

    def __init__(self, folder, environment, script, uses):
        if os.geteuid() != 0:
            pytest.skip("slurmd needs root")
        munged, slurmctld, slurmd, self.scontrol = needed("munged", "slurmctld", "slurmd",
                                                          "scontrol")
        needed("sinfo", "sbatch", "squeue")
        self.folder = folder
        self.script = script
        self.configuration = folder / "slurm.conf"
        (folder / "state").mkdir()
        (folder / "spool").mkdir()
        key = folder / "key"
        key.write_bytes(os.urandom(128))
        key.chmod(0o600)
        self.write_configuration(uses.format(folder=folder))
        (folder / "cgroup.conf").write_text("CgroupPlugin=autodetect\n")
        (folder / "requirements.json").write_text(REQUIREMENT)
        self.set()
        variables = {**environment, "SLURM_CONF": str(self.configuration),
                     "ASSAY_SETTINGS": str(folder / "settings"), "ASSAY_SCRIPTED_EGL": str(script)}
        variables.pop("PATH", None)
        write_program(folder / "health", "".join(
            f"export {name}={shlex.quote(value)}\n" for name, value in variables.items())
            + f"exec {SCRIPT}\n")
        options = {"env": {**os.environ, "SLURM_CONF": str(self.configuration)}}
        self.servers = [
            Server(folder / "munged.log", munged, "--foreground",
                   f"--socket={folder}/munge.socket", f"--key-file={key}",
                   f"--log-file={folder}/munge-file.log", f"--pid-file={folder}/munged.pid",
                   f"--seed-file={folder}/seed"),
            Server(folder / "slurmctld.log", slurmctld, "-D", "-c", **options),
            Server(folder / "slurmd.log", slurmd, "-D", "-N", "machine", **options)]

    def set(self, **variables):
        """Changes the settings of the health check. None sees a part of them."""
        variables = {"ASSAY_HOST": HOST, "ASSAY_REQUIREMENTS": self.folder / "requirements.json", **variables}
        new = self.folder / "new-settings"
        new.write_text("".join(f"{name}={value}\n" for name, value in variables.items()))
        new.rename(self.folder / "settings")

    def write_configuration(self, uses):
        sockets = [socket.socket() for _ in range(2)]
        for each in sockets:
            each.bind(("127.0.0.1", 0))
        ports = [each.getsockname()[1] for each in sockets]
        for each in sockets:
            each.close()
        self.configuration.write_text(CONFIGURATION.format(
            host=socket.gethostname().split(".")[0], ports=ports, folder=self.folder, uses=uses))

    def __enter__(self):
        self.started = []
        ready = ["Created .* work threads", "Running as primary controller",
                 "slurmd started|slurmd initialization failed"]
        for server, pattern in zip(self.servers, ready):
            server.__enter__()
            self.started.append(server)
            found = server.wait_for(pattern)
        if "failed" in found.group():
            log = server.text().strip().splitlines()
            self.__exit__()
            pytest.skip(f"slurmd does not run here: {log[-2]}")
        return self

    def __exit__(self, *_):
        for server in reversed(self.started):
            server.__exit__()

    def ask(self, *command):
        status, text = outcome_of(*command,
                                  env={**os.environ, "SLURM_CONF": str(self.configuration)})
        assert status == 0, text
        return text.strip()

    def reason(self):
        return self.ask("sinfo", "-R", "--noheader", "--format=%E")

    def state(self):
        return self.ask("sinfo", "--noheader", "--format=%T")


@pytest.fixture(name="cluster", params=[HEALTH_CHECK], ids=["health-check"])
def fixture_cluster(host, request):
    # munged refuses folders that others can't enter, which pytest's are.
    folder = Path(tempfile.mkdtemp(prefix="assay-slurm-"))
    folder.chmod(0o755)
    script = folder / "driver"
    script.write_text(Gpu().script(), encoding="ascii")
    try:
        with Cluster(folder, host.environment(script=script), script, request.param) as cluster:
            yield cluster
    finally:
        shutil.rmtree(folder)


def test_node_with_a_crashing_driver_is_drained_and_resumed(cluster):
    until(lambda: cluster.state() == "idle", "the node doesn't come up")
    cluster.script.write_text(Gpu().script() + "at glCompileShader crash\n", encoding="ascii")
    until(lambda: cluster.state() == "drained", "the node isn't drained")
    assert cluster.reason().startswith("assay: crashed: assay crashed")
    questions = [line for line in DOCS.read_text(encoding="utf-8").splitlines()
                 if line.startswith("sinfo -N")]
    nodes, counts = [cluster.ask("bash", "-c", question) for question in questions]
    assert nodes.startswith("machine drained assay: crashed: ")
    assert counts.startswith("1 assay: crashed: ")

    mark = cluster.folder / "ran"
    job = write_program(cluster.folder / "job", f"touch {mark}\n")
    cluster.ask("sbatch", "--output=/dev/null", job)
    until(lambda: "DRAINED" in cluster.ask("squeue", "--noheader", "--format=%r"),
          "the job doesn't wait for the node")
    assert not mark.exists()

    cluster.script.write_text(Gpu().script(), encoding="ascii")
    until(mark.exists, "the job doesn't run after the repair")
    until(lambda: cluster.state() == "idle", "the node isn't idle again")
    assert cluster.reason() == ""


def test_node_that_an_administrator_drained_stays_so(cluster):
    until(lambda: cluster.state() == "idle", "the node doesn't come up")
    cluster.ask(cluster.scontrol, "update", "NodeName=machine", "State=DRAIN", "Reason=new disk")
    subprocess.run([cluster.folder / "health"], env={"SLURMD_NODENAME": "machine"}, check=True)
    assert (cluster.state(), cluster.reason()) == ("drained", "new disk")
    cluster.script.write_text(Gpu().script() + "at glCompileShader crash\n", encoding="ascii")
    subprocess.run([cluster.folder / "health"], env={"SLURMD_NODENAME": "machine"}, check=True)
    assert (cluster.state(), cluster.reason()) == ("drained", "new disk")


def test_node_with_a_hanging_driver_is_drained_and_resumed(cluster):
    until(lambda: cluster.state() == "idle", "the node doesn't come up")
    hanging = cluster.folder / "hanging"
    hanging.write_text(Gpu().script() + "at glCompileShader hang\n", encoding="ascii")
    cluster.set(ASSAY_SCRIPTED_EGL=hanging, ASSAY_TIMEOUT=1)
    until(lambda: cluster.state() == "drained", "the node isn't drained")
    assert re.match("assay: hung: .* 1 s ", cluster.reason())
    cluster.set()
    until(lambda: cluster.state() == "idle", "the node isn't idle again")
    assert cluster.reason() == ""
    # What hung is gone.
    assert processes_with(bytes(hanging)) == []


@pytest.mark.parametrize("cluster", [PROLOG], ids=["prolog"], indirect=True)
def test_prolog_keeps_a_job_from_a_node_with_a_crashing_driver(cluster):
    until(lambda: cluster.state() == "idle", "the node doesn't come up")
    jobs = {}
    for name in "first", "second":
        jobs[name] = write_program(cluster.folder / name, f"touch {cluster.folder}/ran-{name}\n")
    cluster.ask("sbatch", "--output=/dev/null", jobs["first"])
    until((cluster.folder / "ran-first").exists, "no job runs on a node that works")
    until(lambda: cluster.state() == "idle", "the job doesn't end")
    assert cluster.reason() == ""

    cluster.script.write_text(Gpu().script() + "at glCompileShader crash\n", encoding="ascii")
    cluster.ask("sbatch", "--output=/dev/null", jobs["second"])
    until(lambda: "held" in cluster.ask("squeue", "--noheader", "--format=%r"), "the job isn't held")
    until(lambda: cluster.state() == "drained", "the node isn't drained")
    assert cluster.reason().startswith("assay: crashed: ")
    assert not (cluster.folder / "ran-second").exists()
