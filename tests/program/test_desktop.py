"""The desktop example with a scripted driver: what it draws with at its starts while the driver works,
crashes and is updated. Its window is that of SDL's driver without a display."""

import os
import shutil
import signal
import subprocess

import pytest

from harness import BUILD, PROGRAM, SANITIZED_BY, SCRIPTED_EGL, Run, read_record, until
from hosting import host_run

DESKTOP = BUILD / "bin" / "desktop"

pytestmark = [
    pytest.mark.skipif(not DESKTOP.exists(),
                       reason="the desktop example isn't built: SDL 2 (libsdl2-dev) isn't there"),
    pytest.mark.skipif(SANITIZED_BY == "thread",
                       reason="the thread sanitizer doesn't support the keeper of the child"),
]

DRIVER = """device
string GL_VENDOR "A vendor"
string GL_RENDERER "A renderer"
version "2.1 Scripted"
extensions "GL_ARB_vertex_program GL_ARB_fragment_program GL_EXT_framebuffer_object"
"""
FRAMES = 3


class Desktop:
    """The program, its folder, and a driver that is installed for it alone."""

    def __init__(self, host, folder):
        self.folder = folder / "program"
        self.script = folder / "driver"
        self.record = folder / "record"
        self.libraries = folder / "libraries"
        shutil.copytree(SCRIPTED_EGL, self.libraries)
        self.set_driver("")
        self.environment = host.environment(self.script)
        self.environment["LD_LIBRARY_PATH"] = self.environment["LD_LIBRARY_PATH"].replace(
            str(SCRIPTED_EGL), str(self.libraries))
        self.environment["SDL_VIDEODRIVER"] = "offscreen"
        # SDL and its libraries keep some memory to the end.
        self.environment["ASAN_OPTIONS"] += ":detect_leaks=0"

    def set_driver(self, rules):
        """Changes what the driver does. Its files stay as they are."""
        self.script.write_text(f"record {self.record}\n{DRIVER}{rules}\n")

    def update_driver(self, rules):
        """Replaces the driver's file by one with the same version text."""
        self.set_driver(rules)
        library = self.libraries / "libEGL.so.1"
        update = library.with_name("update")
        update.write_bytes(library.read_bytes() + b"\0")
        update.replace(library)

    def start(self):
        """Returns the run, and the calls of the driver by the child and the program."""
        self.record.unlink(missing_ok=True)
        done = subprocess.run(
            [DESKTOP, "--frames", str(FRAMES), self.folder, PROGRAM], env=self.environment,
            stdout=subprocess.PIPE, stderr=subprocess.PIPE, check=False)
        calls = [call.name for call in read_record(self.record)] if self.record.exists() else []
        return Run(done.returncode, done.stdout, done.stderr), calls

    def choose(self, choice):
        run = host_run("state", "set", choice, "--state", str(self.folder / "graphics"),
                       environment=self.environment)
        assert run.status == 0


@pytest.fixture
def desktop(host, tmp_path):
    return Desktop(host, tmp_path)


def check(start, advice, drawn_with):
    """The start ended well, was advised so, and drew with it. Only the program shows frames."""
    run, calls = start
    assert (run.status, run.errors) == (0, [])
    assert run.lines[0].startswith(f"advice: {advice}: ")
    assert run.lines[-1] == drawn_with
    hardware = drawn_with.startswith("hardware: ")
    assert calls.count("eglSwapBuffers") == (FRAMES if hardware else 0)


def check_crashed(start, advice):
    run, calls = start
    assert run.status == -signal.SIGSEGV
    assert run.lines[0].startswith(f"advice: {advice}: ")
    assert run.lines[-1] == "hardware: A renderer"
    assert "eglMakeCurrent" in calls


def test_a_driver_that_crashes_and_is_updated(desktop):
    check(desktop.start(), "hardware by attempt", "hardware: A renderer")
    desktop.set_driver("at glClear crash")
    check_crashed(desktop.start(), "hardware by memory")
    check(desktop.start(), "broken by attempt", "software: software")
    desktop.update_driver("")
    check(desktop.start(), "hardware by attempt", "hardware: A renderer")
    check(desktop.start(), "hardware by memory", "hardware: A renderer")


def test_software_does_not_load_the_driver(desktop):
    desktop.set_driver("at glClear crash")
    check(desktop.start(), "broken by attempt", "software: software")
    again = desktop.start()
    check(again, "broken by memory", "software: software")
    assert again[1] == [], "a call of the driver"


def test_a_crash_of_the_program_alone(desktop):
    """The trials don't show frames, so that they pass. Three crashes are enough."""
    desktop.set_driver("at eglSwapBuffers crash")
    for _ in range(3):
        check_crashed(desktop.start(), "hardware by attempt")
    for _ in range(2):
        start = desktop.start()
        check(start, "hardware by memory", "software: software")
        assert start[1] == [], "a call of the driver"
        assert "this program crashed 3 times with this driver" in start[0].lines
    desktop.update_driver("")
    check(desktop.start(), "hardware by attempt", "hardware: A renderer")


def test_no_context(desktop):
    """The program falls back in the same start."""
    check(desktop.start(), "hardware by attempt", "hardware: A renderer")
    desktop.set_driver("at eglCreateContext error EGL_BAD_ALLOC")
    check(desktop.start(), "hardware by memory", "software: software")


def test_an_orderly_end_is_no_crash(desktop):
    desktop.set_driver("")
    with subprocess.Popen([DESKTOP, desktop.folder, PROGRAM], env=desktop.environment,
                          stdout=subprocess.PIPE) as program:
        until(lambda: desktop.record.exists() and "eglSwapBuffers" in desktop.record.read_text(),
              "no frame")
        os.kill(program.pid, signal.SIGTERM)
        program.communicate()
        assert program.returncode == 0
    check(desktop.start(), "hardware by memory", "hardware: A renderer")


def test_the_users_choice(desktop):
    desktop.folder.mkdir()
    desktop.choose("opengl=software")
    start = desktop.start()
    check(start, "software by choice", "software: software")
    assert start[1] == [], "a call of the driver"
    desktop.choose("opengl=auto")
    check(desktop.start(), "hardware by attempt", "hardware: A renderer")
