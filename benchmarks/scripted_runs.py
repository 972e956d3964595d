"""What the comparisons of assay-host share: the scripted OpenGL driver of the tests, and the timing of
commands in turn."""

import os
import random
import sys
import time
from typing import NamedTuple

SCRIPT = """device
{more}string GL_VENDOR "A vendor"
string GL_RENDERER "A renderer"
version "2.1 Scripted"
extensions "GL_ARB_vertex_program GL_ARB_fragment_program GL_EXT_framebuffer_object"
"""


class Taken(NamedTuple):
    """The time of one command in milliseconds."""

    wall: float
    processor: float  # of the process and of its children that it waited for


def scripted_environment(build, name, more=""):
    """Returns the environment of a machine with the driver, which returns at once, and without an OpenCL
    library. `name` is of the files below the build folder; `more` are lines of the script."""
    script = build / f"{name}.script"
    script.write_text(SCRIPT.format(more=more))
    empty = build / f"{name}.no-opencl"
    empty.mkdir(exist_ok=True)
    for library in ("libOpenCL.so.1", "libOpenCL.so"):
        (empty / library).touch()
    return {**os.environ, "LD_LIBRARY_PATH": f"{build / 'drivers' / 'egl'}:{empty}",
            "ASSAY_SCRIPTED_EGL": str(script)}


def time_once(command, environment, statuses=(0,)):
    """Runs a command without streams. Ends this program if the status is another one."""
    words = [str(word) for word in command]
    streams = [(os.POSIX_SPAWN_OPEN, number, os.devnull, os.O_RDWR, 0) for number in range(3)]
    start = time.perf_counter()
    child = os.posix_spawn(words[0], words, environment, file_actions=streams)
    _, state, usage = os.wait4(child, 0)
    taken = 1000 * (time.perf_counter() - start)
    if not os.WIFEXITED(state) or os.WEXITSTATUS(state) not in statuses:
        sys.exit(f"{' '.join(words)} ended with {os.waitstatus_to_exitcode(state)}")
    return Taken(taken, 1000 * (usage.ru_utime + usage.ru_stime))


def time_in_turn(commands, runs, environment, statuses=(0,), before=lambda name: None):
    """Times each command of a dictionary in every round, in an order that changes. Returns lists of
    times by the commands' names. `before` is called before each command."""
    times = {name: [] for name in commands}
    order = list(commands)
    shuffle = random.Random(1).shuffle
    for _ in range(runs):
        shuffle(order)
        for name in order:
            before(name)
            times[name].append(time_once(commands[name], environment, statuses))
    return times
