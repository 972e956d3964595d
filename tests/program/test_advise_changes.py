"""Which changes of a machine make `assay-host advise` try its drivers again, by the program and real
files: one attempt for each change, and none without one."""

import os
import shutil
import uuid

import pytest

from harness import SCRIPTED_EGL
from namespaces import Namespace, why_no_namespace
from starts import BROKEN, HARDWARE, UNKNOWN, Starts, kill_all

NO_NAMESPACE = why_no_namespace()
needs_namespace = pytest.mark.skipif(NO_NAMESPACE is not None, reason=str(NO_NAMESPACE))


@pytest.fixture
def starts(host, tmp_path):
    return Starts(host, tmp_path)


@pytest.fixture
def namespace():
    with Namespace() as space:
        yield space


def check_one_attempt(starts, **more):
    """The next call makes an attempt for a state of the machine of which nothing is known."""
    children = starts.children
    answer = starts.advise(**more)
    assert (answer.status, answer.tried, answer.document["due"]) == (HARDWARE, True, "first")
    check_no_attempt(starts, **more)
    assert starts.children == children + 1


def check_no_attempt(starts, **more):
    answer = starts.advise(**more)
    assert (answer.status, answer.tried) == (HARDWARE, False)


def test_a_replaced_file_of_a_driver(starts):
    """The version text of the driver stays the same; only its file changes."""
    libraries = starts.folder / "libraries"
    libraries.mkdir()
    for file in SCRIPTED_EGL.iterdir():
        shutil.copy2(file, libraries / file.name, follow_symlinks=True)
    before = starts.environment["LD_LIBRARY_PATH"]
    starts.variables = {"LD_LIBRARY_PATH": before.replace(str(SCRIPTED_EGL), str(libraries))}
    starts.set_driver("at eglInitialize crash\n")
    assert starts.advise().tried
    assert not starts.advise().tried
    library = libraries / "libEGL.so.1"
    library.write_bytes(library.read_bytes())
    os.utime(library, (1, 1))
    assert starts.advise().tried
    assert not starts.advise().tried
    with open(library, "ab") as file:
        file.write(b"\0")
    os.utime(library, (1, 1))
    starts.set_driver("")
    answer = starts.advise()
    assert (answer.status, answer.tried) == (HARDWARE, True)
    assert answer.document["opengl"]["warning"] is None
    assert not starts.advise().tried
    assert starts.children == 3
    assert len(list(starts.state.glob("*.json"))) == 3


def test_a_file_in_the_list_of_opencl_drivers(starts):
    vendors = starts.folder / "vendors"
    vendors.mkdir()
    (vendors / "one.icd").write_text("libnone.so.1\n")
    starts.variables = {"OCL_ICD_VENDORS": str(vendors)}
    check_one_attempt(starts)
    added = vendors / "two.icd"
    added.write_text("libnone.so.2\n")
    check_one_attempt(starts)
    added.unlink()
    check_no_attempt(starts)


def test_a_file_in_the_list_of_egl_drivers(starts):
    vendors = starts.folder / "vendors"
    vendors.mkdir()
    starts.variables = {"__EGL_VENDOR_LIBRARY_DIRS": str(vendors)}
    check_one_attempt(starts)
    (vendors / "10_new.json").write_text('{"ICD": {"library_path": "libnone.so.1"}}')
    check_one_attempt(starts)


def test_a_variable_that_selects_a_driver(starts):
    check_one_attempt(starts)
    for name, value in (("LIBGL_ALWAYS_SOFTWARE", "1"), ("DRI_PRIME", "1"),
                        ("MESA_LOADER_DRIVER_OVERRIDE", "zink"), ("OCL_ICD_FILENAMES", "none.so"),
                        ("__EGL_VENDOR_LIBRARY_FILENAMES", "")):
        starts.variables = {name: value}
        check_one_attempt(starts)
    starts.variables = {"LANG": "de_DE.UTF-8", "DISPLAY": ":5", "MESA_DEBUG": "1"}
    check_no_attempt(starts)


@needs_namespace
@pytest.mark.parametrize("name", ["osrelease", "version"])
def test_another_kernel(starts, namespace, name):
    check_one_attempt(starts)
    check_no_attempt(starts, around=namespace.around)
    kernel = starts.folder / "kernel"
    kernel.write_text("9.9.9-new\n")
    namespace.cover(f"/proc/sys/kernel/{name}", kernel)
    check_one_attempt(starts, around=namespace.around)
    check_no_attempt(starts)


@needs_namespace
def test_an_added_adapter(starts, namespace):
    devices = starts.folder / "devices"

    def add(slot, vendor, device):
        (devices / slot).mkdir(parents=True)
        for file, value in (("class", "0x030000"), ("vendor", vendor), ("device", device)):
            (devices / slot / file).write_text(value + "\n")

    add("0000:00:02.0", "0x8086", "0xa7a0")
    namespace.cover("/sys/bus/pci/devices", devices)
    check_one_attempt(starts, around=namespace.around)
    add("0000:01:00.0", "0x10de", "0x2484")
    check_one_attempt(starts, around=namespace.around)
    (devices / "0000:01:00.0" / "device").write_text("0x2485\n")
    check_one_attempt(starts, around=namespace.around)
    shutil.rmtree(devices / "0000:01:00.0")
    check_no_attempt(starts, around=namespace.around)


@needs_namespace
def test_another_boot_after_a_host_that_was_killed_with_everything(starts, namespace):
    starts.set_driver("at eglInitialize hang\n")

    def boot():
        text = starts.folder / str(uuid.uuid4())
        text.write_text(f"{uuid.uuid4()}\n")
        namespace.cover("/proc/sys/kernel/random/boot_id", text)

    for count in (1, 2):
        boot()
        starts.runs.unlink(missing_ok=True)
        with starts.start("--timeout", "0", around=namespace.around) as call:
            kill_all(call, starts)
        # While the system goes on, the host may have been killed by anybody.
        plan = starts.advise("--dry-run", around=namespace.around)
        assert plan.status == UNKNOWN
        assert plan.document["opengl"]["reason"] == ("host-ended" if count == 1 else "system-ended")
        boot()
        plan = starts.advise("--dry-run", around=namespace.around)
        assert plan.document["opengl"]["reason"] == "system-ended"
        assert plan.status == (UNKNOWN if count == 1 else BROKEN)
    answer = starts.advise(around=namespace.around)
    assert (answer.status, answer.tried) == (BROKEN, False)
