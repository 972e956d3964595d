"""Writes the files of a Linux kernel that describe graphics adapters, as far as the program reads
them, below a folder that replaces the root of the file system."""

import os
from dataclasses import dataclass


@dataclass
class Adapter:
    """An AMD card with dedicated memory, whose driver reports name and memory itself."""

    index: int
    name: str
    memory_mb: int = 2048
    device_id: int = 0x7310
    vendor_id: int = 0x1002
    driver: str = "amdgpu"
    driver_version: str = "6.1.0"
    driver_date: str = ""
    integrated: bool = False

    @property
    def card(self):
        return f"card{self.index}"

    @property
    def address(self):
        return f"0000:{self.index + 1:02x}:00.0"


def put(path, text):
    path.parent.mkdir(parents=True, exist_ok=True)
    path.write_text(text + "\n")


def link(path, target):
    path.parent.mkdir(parents=True, exist_ok=True)
    path.symlink_to(os.path.relpath(target, path.parent))


def write_tree(root, adapters):
    """Writes the files of a machine with these adapters."""
    (root / "sys/class/drm").mkdir(parents=True)
    put(root / "proc/sys/kernel/osrelease", "6.1.0-test")
    for adapter in adapters:
        device = root / "sys/devices/pci0000:00" / adapter.address
        put(device / "vendor", f"0x{adapter.vendor_id:04x}")
        put(device / "device", f"0x{adapter.device_id:04x}")
        put(device / "subsystem_vendor", "0x1002")
        put(device / "subsystem_device", "0x0b36")
        put(device / "revision", "0xc4")
        put(device / "class", "0x030000")
        put(device / "boot_vga", str(int(adapter.index == 0)))
        put(device / "product_name", adapter.name)
        put(device / "mem_info_vram_total", str(adapter.memory_mb << 20))
        put(device / "mem_info_gtt_total", str(1 << 32))
        driver = root / "sys/bus/pci/drivers" / adapter.driver
        driver.mkdir(parents=True, exist_ok=True)
        put(root / "sys/module" / adapter.driver / "version", adapter.driver_version)
        if not (driver / "module").is_symlink():
            link(driver / "module", root / "sys/module" / adapter.driver)
        link(device / "driver", driver)
        link(device / "subsystem", root / "sys/bus/pci")
        link(root / "sys/bus/pci/devices" / adapter.address, device)
        for node in (adapter.card, f"renderD{128 + adapter.index}"):
            put(device / "drm" / node / "dev", f"226:{adapter.index}")
            link(device / "drm" / node / "device", device)
            link(root / "sys/class/drm" / node, device / "drm" / node)
        connector = device / "drm" / adapter.card / f"{adapter.card}-DP-1"
        put(connector / "status", "connected")
        put(connector / "enabled", "enabled")
        put(connector / "modes", "1920x1080\n1280x720")
        link(root / "sys/class/drm" / connector.name, connector)
