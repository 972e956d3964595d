"""The distribution's packages that files are from, with their licences."""

import os
import re
import subprocess
from dataclasses import dataclass
from pathlib import Path

TREE = Path(__file__).resolve().parents[2]
# The Boost of a build for Windows is compiled from the distribution's source package.
BOOST_SOURCE = TREE / "build" / "deps" / "boost"
MAX_COPYRIGHT = 200_000
GCC = "GPL-3.0-or-later WITH GCC-exception-3.1"

# The names of the packages that are known, with their licences as SPDX expressions, and whether their
# headers have code that gets into a program. The other headers only declare what is elsewhere.
KNOWN = [
    (r"(lib)?boost\d.*|libboost-.*", "BSL-1.0", True),
    (r"libfmt.*", "MIT", True),
    (r"libcli11-dev", "BSD-3-Clause", True),
    (r"nlohmann-json3-dev", "MIT", True),
    (r"googletest|lib[gm]test-dev|libgmock-dev", "BSD-3-Clause", True),
    (r"libstdc\+\+.*|libgcc-.*|(gcc|g\+\+)-mingw-w64.*", GCC, True),
    (r"libc6.*", "LGPL-2.1-or-later", False),
    (r"linux-libc-dev.*", "GPL-2.0-only WITH Linux-syscall-note", False),
    (r"mingw-w64-.*", "ZPL-2.1 AND MIT AND BSD-3-Clause", False),
    (r"opencl-c-headers", "Apache-2.0", False),
    (r"lib(egl|gl|drm|pciaccess)-dev", "MIT", False),
]


@dataclass(frozen=True, order=True)
class Package:
    name: str
    version: str
    architecture: str

    def known(self):
        for names, licence, headers_are_code in KNOWN:
            if re.fullmatch(names, self.name):
                return licence, headers_are_code
        raise LookupError(f"the licence of the package {self.name} isn't known: add it to {__file__}")

    @property
    def licence(self):
        return self.known()[0]

    @property
    def headers_are_code(self):
        return self.known()[1]

    def licence_text(self):
        """The package's copyright file; of a large one, only the text of the package's licence."""
        if self.architecture == "source":
            return (BOOST_SOURCE / "LICENSE_1_0.txt").read_text(encoding="utf-8")
        text = Path(f"/usr/share/doc/{self.name}/copyright").read_text(encoding="utf-8")
        found = re.search(rf"^License: {re.escape(self.licence)}\n((?: .*\n)+)", text, re.MULTILINE)
        return found.group(1) if found and len(text) > MAX_COPYRIGHT else text


def query(option, *arguments):
    # What has no owner makes the status 1, and is judged by the caller.
    return subprocess.run(["dpkg-query", option, *arguments], check=False, stdout=subprocess.PIPE,
                          stderr=subprocess.DEVNULL).stdout.decode()


def distribution(key):
    """The distribution's ID, as in a package URL, or its NAME."""
    release = Path("/etc/os-release").read_text(encoding="utf-8")
    return re.search(rf'^{key}="?([^"\n]+)', release, re.MULTILINE).group(1)


def names_of(path):
    """The path, and as packages name it that have it in /lib, a link to /usr/lib."""
    path = str(path)
    return [path] + ([path[len("/usr"):]] if path.startswith("/usr/lib") else [])


def installed(qualified):
    name, version, architecture = query(
        "-W", "-f", "${Package} ${Version} ${Architecture}", qualified).split()
    return Package(name, version, architecture)


def boost_source():
    return Package(query("-W", "-f", "${source:Package}", "libboost1.74-dev"),
                   (BOOST_SOURCE / "version").read_text(encoding="utf-8").strip(), "source")


def owners(paths):
    """The package of each path. LookupError if one is of no package."""
    owner_of = {path: boost_source() for path in paths if BOOST_SOURCE in path.parents}
    others = sorted(set(paths) - owner_of.keys())
    wanted = os.environ.get("DEB_HOST_ARCH")
    by_name, packages = {}, {}
    for line in query("--search", *(name for path in others for name in names_of(path))).splitlines():
        qualified, _, name = line.partition(": ")
        if not qualified.startswith("diversion by"):
            offers = qualified.split(", ")
            by_name[name] = next((each for each in offers if each.endswith(f":{wanted}")), offers[0])
    for path in others:
        qualified = next((by_name[name] for name in names_of(path) if name in by_name), None)
        if not qualified:
            raise LookupError(f"{path} is of no package")
        if qualified not in packages:
            packages[qualified] = installed(qualified)
        owner_of[path] = packages[qualified]
    return owner_of
