"""scripts/record-adapters: a recording describes the machine, without data that identifies it."""

import os
import re
import subprocess
import sys
from pathlib import Path

import pytest

import trees

SCRIPT = Path(__file__).resolve().parents[2] / "scripts" / "record-adapters"

# "unreadable" was damaged by hand, in ways that a recording doesn't preserve.
WHOLE = [name for name in trees.NAMES if name != "unreadable"]


def record(root, *arguments):
    return subprocess.run([sys.executable, SCRIPT, "--root", root, *arguments], check=True,
                          capture_output=True, text=True, timeout=60).stdout


def put(root, path, text):
    (root / path).parent.mkdir(parents=True, exist_ok=True)
    (root / path).write_text(text, encoding="utf-8")


@pytest.mark.parametrize("name", WHOLE)
def test_recording_a_recorded_machine_gives_the_same(tmp_path, name):
    recorded = record(trees.unpack(name, tmp_path / "root"))
    kept = (trees.DATA / name / "tree.txt").read_text(encoding="ascii")
    if name == "hybrid-laptop":
        # Reading it would wake the card.
        begin = kept.index("information =")
        kept = kept[:begin] + kept[kept.index("@", begin):]
    assert recorded == kept


def test_a_damaged_machine_is_recorded_as_far_as_possible(tmp_path):
    recorded = record(trees.unpack("unreadable", tmp_path / "root"))
    assert "0000:01:00.0" in recorded


def test_nothing_identifies_the_machine(tmp_path):
    root = trees.unpack("nvidia-drm", tmp_path / "root")
    card = "proc/driver/nvidia/gpus/0000:01:00.0"
    device = "sys/bus/pci/devices/0000:01:00.0"
    put(root, f"{card}/information", "Model: \t\t NVIDIA X\n"
        "GPU UUID: \t GPU-deadbeef-dead-beef-dead-beefdeadbeef\nVideo BIOS: \t 94.02.42.40.44\n")
    put(root, "proc/driver/nvidia/version",
        "NVRM version: NVIDIA UNIX x86_64  550.54.15  (someone@secret-host)  Tue\n")
    put(root, "proc/sys/kernel/hostname", "secret-host\n")
    put(root, "etc/hostname", "secret-host\n")
    put(root, "etc/machine-id", "deadbeefdeadbeef\n")
    put(root, f"{device}/serial_number", "deadbeef\n")
    put(root, f"{device}/unique_id", "deadbeef\n")
    put(root, f"{device}/resource", "0x00000deadbee0000 0x00000deadbeeffff 0x0000000000140204\n")
    put(root, "sys/class/net/eth0/address", "de:ad:be:ef:de:ad\n")
    recorded = record(root)
    assert not re.search("deadbee|beef|de:ad|someone|secret|94.02", recorded)
    assert "GPU-????????" in recorded and "(user@host)" in recorded
    assert "0x0000000000000000 0x000000000000ffff 0x0000000000140204" in recorded


def test_devices_outside_pci_keep_only_the_device_trees_lines(tmp_path):
    root = trees.unpack("soc-v3d", tmp_path / "root")
    put(root, "sys/devices/platform/gpu/uevent",
        "DRIVER=vc4-drm\nOF_FULLNAME=/gpu\nOF_COMPATIBLE_0=brcm,bcm2711-vc5\nSERIAL=beef\n")
    recorded = record(root)
    assert "| OF_COMPATIBLE_0=brcm,bcm2711-vc5" in recorded
    assert "beef" not in recorded and "FULLNAME" not in recorded


def test_no_sleeping_card_is_queried(tmp_path):
    root = trees.unpack("intel-arc-xe", tmp_path / "root")
    assert "renderD128.xe" in record(root)
    put(root, "sys/bus/pci/devices/0000:03:00.0/power/runtime_status", "suspended\n")
    assert "renderD128.xe" not in record(root)


def test_recording_can_be_unpacked(tmp_path, monkeypatch):
    root = trees.unpack("radeon", tmp_path / "root")
    (tmp_path / "again").mkdir()
    assert record(root, tmp_path / "again" / "tree.txt") == ""
    monkeypatch.setattr(trees, "DATA", tmp_path)
    unpacked = trees.unpack("again", tmp_path / "unpacked")
    assert os.readlink(unpacked / "sys/class/drm/card0") == os.readlink(root / "sys/class/drm/card0")
    assert (unpacked / "dev/dri/renderD128.radeon").read_bytes() == \
        (root / "dev/dri/renderD128.radeon").read_bytes()


def test_this_machine_can_be_recorded():
    """The recording has this machine's own data."""
    recorded = record("/")
    assert recorded.startswith("@ ")
    assert f"osrelease = {os.uname().release}" in recorded
