"""What an optimised program or shared library must have of the distribution's hardening."""

import re
import subprocess


def readelf(option, file):
    return subprocess.run(["readelf", "--wide", option, file], check=True,
                          stdout=subprocess.PIPE).stdout.decode()


def not_hardened(file):
    """The names of what the program or shared library lacks; [] if it has all."""
    dynamic = readelf("--dynamic", file)
    symbols = readelf("--dyn-syms", file)
    found = {
        "position independent": re.search(r"^\s*Type:\s*DYN\b", readelf("--file-header", file),
                                          re.MULTILINE),
        "immediate binding": re.search(r"\(FLAGS_1\).*\bNOW\b", dynamic),
        "read-only relocations": "GNU_RELRO" in readelf("--segments", file),
        "stack protector": "__stack_chk_fail@" in symbols,
        "checked C functions": re.search(r"__\w+_chk@", symbols),
    }
    return [name for name, value in found.items() if not value]
