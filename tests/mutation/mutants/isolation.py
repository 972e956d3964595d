"""Starts inside.py in namespaces of its own, which end with all their processes."""
import json
import os
import subprocess
import tempfile
from pathlib import Path

COMMAND = ["unshare", "--mount", "--pid", "--fork", "--kill-child=KILL", "--mount-proc", "--ipc", "--net",
           "/usr/bin/python3", str(Path(__file__).resolve().parent / "inside.py")]
KEPT = ("PATH", "LANG", "LC_ALL", "TZ")


def run(job, folder, seconds):
    """The result of a job, or (None, output) if its processes ended without one or took longer."""
    environment = {name: os.environ[name] for name in KEPT if name in os.environ}
    with tempfile.NamedTemporaryFile("w", dir=folder, suffix=".job") as file:
        json.dump(job, file)
        file.flush()
        with tempfile.TemporaryFile(dir=folder) as output:
            child = subprocess.Popen([*COMMAND, file.name], stdin=subprocess.DEVNULL, stdout=output,
                                     stderr=subprocess.STDOUT, start_new_session=True, env=environment)
            try:
                child.wait(seconds)
            except subprocess.TimeoutExpired:
                pass
            finally:
                # The kernel kills the whole namespace with its first process.
                child.kill()
                child.wait()
            output.seek(max(0, output.seek(0, 2) - (256 << 20)))
            said = output.read().decode(errors="replace")
    try:
        return json.loads(said.splitlines()[-1]), ""
    except (IndexError, ValueError):
        return None, said[-4000:]
