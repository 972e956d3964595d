"""The model of the OpenCL half of a report: devices that become a driver script and, by the table of
tests alone, report lines."""

from dataclasses import dataclass, field

# The key tests in the order in which they run.
CL_KEYS = [
    "CLPlatformVersion", "CLDeviceVersion", "IsIntegratedCLGPU", "CLMemoryMB", "CLName", "CLVendor",
    "CLVendorID", "CLDriverVersion", "CUDASupported", "CUDAVersion", "CLBandwidth", "CLCompute",
]

BYTES_PER_BATCH = 2.0 * 16777216 * 10


def quoted(text):
    return f'"{text}"'


def escaped(text):
    """The text as a literal of a driver script."""
    data = text.encode("utf-8", "surrogateescape")
    return '"' + "".join(
        chr(byte) if 0x20 <= byte < 0x7F and byte not in b'"\\' else f"\\x{byte:02X}"
        for byte in data) + '"'


def number(value):
    """A floating-point value as a C++ stream writes it by default."""
    return f"{value:g}"


@dataclass
class ClGpu:
    """One OpenCL GPU, with the answers of its driver."""

    name: str = "A device"
    vendor: str = "A vendor"
    vendor_id: int = 0x10DE
    driver_version: str = "390.77"
    device_version: str = "OpenCL 1.2 of a device"
    memory: int = 3 << 30
    integrated: bool = False
    # The times of a batch of ten copies and of the kernel, in nanoseconds.
    batch: int = 200_000_000
    kernel: int = 250_000_000
    type: str = "gpu"

    def script(self):
        return "\n".join([
            f"device {self.type}",
            f"text CL_DEVICE_NAME {escaped(self.name)}",
            f"text CL_DEVICE_VENDOR {escaped(self.vendor)}",
            f"uint CL_DEVICE_VENDOR_ID {self.vendor_id}",
            f"text CL_DRIVER_VERSION {escaped(self.driver_version)}",
            f"text CL_DEVICE_VERSION {escaped(self.device_version)}",
            f"ulong CL_DEVICE_GLOBAL_MEM_SIZE {self.memory}",
            f"uint CL_DEVICE_HOST_UNIFIED_MEMORY {int(self.integrated)}",
            f"copy-ns {self.batch}" + " 0" * 9,
            f"kernel-ns {self.kernel}",
        ]) + "\n"

    def values(self, platform):
        """The values as the report shows them; None for a key without a line."""
        version = platform.version.removeprefix("OpenCL ")
        version, _, cuda = version.partition(" CUDA ")
        return dict(zip(CL_KEYS, [
            quoted(version),
            quoted(self.device_version.removeprefix("OpenCL ")),
            str(int(self.integrated)),
            str(self.memory >> 20),
            quoted(self.name),
            quoted(self.vendor),
            str(self.vendor_id),
            quoted(self.driver_version),
            str(int(cuda != "")),
            quoted(cuda) if cuda else None,
            number(BYTES_PER_BATCH / (self.batch * 1e-9) if self.batch > 0 else 0.0),
            number(8.0 / (self.kernel * 1e-9) if self.kernel > 0 else 0.0),
        ]))


@dataclass
class ClPlatform:
    devices: list = field(default_factory=list)
    version: str = "OpenCL 1.2 of a platform"

    def script(self):
        return (f"platform\ntext CL_PLATFORM_VERSION {escaped(self.version)}\n"
                + "".join(device.script() for device in self.devices))


def cl_script_of(platforms):
    return "".join(platform.script() for platform in platforms)


def cl_values_of(platforms):
    """The values of each GPU, in the order of the enumeration."""
    return [device.values(platform) for platform in platforms for device in platform.devices
            if device.type == "gpu"]


def cl_test(key):
    """The test of one key. It yields lines, and None for a step."""

    def run(tag, values):
        value = values[key]
        if isinstance(value, Exception):
            raise value
        if value is not None:
            yield f"{tag}.{key}={value}"
        yield None
    return run
