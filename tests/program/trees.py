"""The recorded machines of tests/data/adapters, whose README.md describes the files."""

import re
from pathlib import Path

DATA = Path(__file__).resolve().parents[1] / "data" / "adapters"
NAMES = sorted(folder.name for folder in DATA.iterdir() if folder.is_dir())


def unescape(text):
    codes = {"n": "\n", "t": "\t", "\\": "\\"}
    return re.sub(r"\\(x..|.)", lambda match: codes.get(match[1])
                  or chr(int(match[1][1:], 16)), text).encode("latin-1")


def unpack(name, root):
    """Writes the files of a machine below `root`, and returns it."""
    folder = file = root
    for line in (DATA / name / "tree.txt").read_text(encoding="ascii").splitlines():
        if line.startswith("@ "):
            folder = root / line[2:]
            folder.mkdir(parents=True, exist_ok=True)
        elif line.startswith("| "):
            with file.open("ab") as stream:
                stream.write(unescape(line[2:]) + b"\n")
        else:
            entry, kind, *text = line.split(" ", 2)
            file = folder / entry
            text = text[0] if text else ""
            if kind == "->":
                file.symlink_to(text)
            elif kind == ":=":
                file.write_bytes(unescape(text))
            else:
                assert kind == "=", line
                file.write_bytes(unescape(text) + b"\n" if text else b"")
    return root


def expected(name):
    """The expected values of each device, by key of the report."""
    devices = []
    text = (DATA / name / "expected.txt").read_text(encoding="ascii")
    for block in filter(None, text.split("\n\n")):
        found = re.fullmatch(
            r"name=(.*)\nvendor=(0x\w+) device=(0x\w+)\ndriver=(.*) version=(.*) date=(.*)\n"
            r"memoryMB=(\d+)\nintegrated=(yes|no)\n?", block)
        devices.append({
            "GLName": f'"{found[1]}"',
            "GLVendorID": str(int(found[2], 16)),
            "GLRendererID": str(int(found[3], 16)),
            "GLDriver": f'"{found[4]}"',
            "GLDriverVersion": f'"{found[5]}"',
            "GLDriverDate": f'"{found[6]}"',
            "GLMemoryMB": found[7],
            "IsIntegratedGLGPU": str(int(found[8] == "yes")),
        })
    return devices


def cards(root):
    """The DRM cards of a machine whose devices exist."""
    folder = root / "sys/class/drm"
    found = [path.name for path in folder.glob("card*")
             if re.fullmatch(r"card\d+", path.name) and path.exists()]
    return sorted(found, key=lambda card: int(card[4:]))
