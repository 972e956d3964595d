"""The adapters of recorded machines: the report has each one's own name, ids, driver and memory."""

import shutil

import pytest

import trees

# Disables the queries whose results would replace the memory size of the system's files.
NO_MEMORY_QUERY = ("integer 0x9047 unknown\ninteger 0x87FC unknown\n")

# NVIDIA's EGL device of a card whose driver has no DRM part.
NVIDIA_WITHOUT_NODE = 'device\ndevice-string EGL_EXTENSIONS "EGL_NV_device_cuda"\n'


def device_on(card):
    return f'device\ndrm "/dev/dri/{card}"\n'


def described(run, index, keys):
    return {key: run.facts[f"glgpu[{index}].{key}"] for key in keys}


def assert_devices(run, devices):
    assert run.facts["NumGLGPUs"] == str(len(devices))
    for index, device in enumerate(devices):
        assert described(run, index, device) == device
    assert run.status == 0


@pytest.mark.parametrize("name", trees.NAMES)
def test_machine(host, tmp_path, name):
    """EGL lists the cards in the opposite order: the join is by name, not by index."""
    root = trees.unpack(name, tmp_path / "root")
    devices = [device_on(card) for card in reversed(trees.cards(root))]
    if name == "nvidia-no-drm":
        devices = [NVIDIA_WITHOUT_NODE]
    if not trees.expected(name):
        # A context on a node without an adapter would be reported as the last resort.
        devices = []
    run = host.run(script="".join(device + NO_MEMORY_QUERY for device in devices) or "# none\n",
                   root=root)
    assert_devices(run, trees.expected(name))


@pytest.mark.parametrize("framebuffer_first", [True, False])
def test_the_firmwares_framebuffer_is_not_the_cards_driver(host, tmp_path, framebuffer_first):
    """EGL lists both; the context is the NVIDIA driver's."""
    root = trees.unpack("nvidia-firmware", tmp_path / "root")
    devices = [device_on("card0") + 'string GL_RENDERER "software"\n' + NO_MEMORY_QUERY,
               NVIDIA_WITHOUT_NODE + 'string GL_RENDERER "hardware"\n' + NO_MEMORY_QUERY]
    run = host.run(script="".join(devices if framebuffer_first else reversed(devices)), root=root)
    assert_devices(run, trees.expected("nvidia-firmware"))
    assert run.facts["glgpu[0].GLRenderer"] == '"hardware"'


def test_two_devices_of_a_machine_with_more(host, tmp_path):
    """The third adapter has no context and isn't reported."""
    root = trees.unpack("server-bmc", tmp_path / "root")
    run = host.run(script="".join(device_on(card) + NO_MEMORY_QUERY for card in ("card2", "card0")),
                   root=root)
    bmc, _, second = trees.expected("server-bmc")
    assert_devices(run, [bmc, second])


@pytest.mark.parametrize("nodes", [True, False], ids=["with nodes", "without nodes"])
def test_eight_identical_cards_are_eight_devices(host, tmp_path, nodes):
    """Each has the memory that its own context reports."""
    root = trees.unpack("nvidia-eight", tmp_path / "root")
    devices = [device_on(card) for card in trees.cards(root)]
    if not nodes:
        shutil.rmtree(root / "sys/class/drm")
        devices = [NVIDIA_WITHOUT_NODE] * 8
    script = "".join(f"{device}integer 0x9047 {(index + 1) << 20}\n"
                     for index, device in enumerate(devices))
    run = host.run(script=script, root=root)
    eight = trees.expected("nvidia-eight")
    for index, device in enumerate(eight):
        device["GLMemoryMB"] = str((index + 1) * 1024)
    assert len({device["GLName"] for device in eight}) == 8
    assert_devices(run, eight)


def test_software_renderer_on_a_machine_without_a_gpu(host, tmp_path):
    """The last resort: a device without name or ids, with a message in the log."""
    root = trees.unpack("empty", tmp_path / "root")
    run = host.run("-verbose=1", script="device\nsoftware\n", root=root)
    assert_devices(run, [{
        "GLName": '""', "GLVendorID": "0", "GLRendererID": "0", "GLDriver": '"?"',
        "GLDriverVersion": '"?"', "GLDriverDate": '"?"', "GLMemoryMB": "0",
        "IsIntegratedGLGPU": "0"}])
    assert any(line.endswith(
        "successful context creation but no matching WMI or DXGI devices found")
        for line in run.comments)


def test_last_resort_is_silent_without_the_option(host, tmp_path):
    root = trees.unpack("empty", tmp_path / "root")
    run = host.run(script="device\nsoftware\n", root=root)
    assert run.facts["NumGLGPUs"] == "1"
    assert run.comments == []


def test_software_renderer_that_borrows_a_cards_node_is_not_the_card(host, tmp_path):
    root = trees.unpack("amd-discrete", tmp_path / "root")
    run = host.run(script=device_on("card0") + "software\n", root=root)
    assert run.facts["NumGLGPUs"] == "1"
    assert run.facts["glgpu[0].GLName"] == '""'


def test_a_card_without_a_monitor_is_a_device(host, tmp_path):
    """Its render node replaces the output."""
    root = trees.unpack("hybrid-laptop", tmp_path / "root")
    log = host.run("-verbose=1", script=device_on("card1"), root=root).comments
    assert any(line.endswith("adapter[1] displays: 1") for line in log)
    assert any("output[1]{" in line and line.endswith("DeviceName=renderD129") for line in log)
    assert any(line.endswith("dxgiNumDevices=2") for line in log)


def test_the_log_lists_the_adapters(host, tmp_path):
    """Raw adapters keep their indices, and the one that a virtual machine uses has no count."""
    root = trees.unpack("vfio", tmp_path / "root")
    run = host.run("-verbose=1", script=device_on("card0"), root=root)
    log = run.comments
    assert any("adapter[0]{ VendorID=32902 DeviceId=18048 " in line for line in log)
    assert any(line.endswith("adapter[0] displays: 1") for line in log)
    assert any("adapter[1]{ VendorID=4098 DeviceId=29631 " in line for line in log)
    assert not any("adapter[1] displays: " in line for line in log)
    assert any("output[1]{ DesktopCoordinates={ left=0 top=0 right=1920 bottom=1080}"
               in line for line in log)
    assert any(line.endswith("wmiNumDevices=2") for line in log)
    assert any(line.endswith("dxgiNumDevices=1") for line in log)
