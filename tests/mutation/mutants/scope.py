"""Which sources of the product this platform builds, to which module each belongs, and how clang
reads it."""
import json
import os
import re
import shlex
from collections import Counter
from pathlib import PurePath

PRODUCT = ("qgf", "pmutil", "host")
# The modules of the build's targets. The others are named by the target, without "assay_".
MODULES = {
    "pmutil": "pmutil/all", "pmutil_gpu": "pmutil/gpu", "assay_app": "assay/app", "assay": "assay/app",
    "assay_host_app": "host/app", "assay-host": "host/app",
}

INCLUDE = re.compile(r'#include "([^"]+)"')


class Source:
    def __init__(self, path, module, arguments):
        self.path, self.module, self.arguments = path, module, arguments


def module_of(target, path):
    if target.startswith("pmutil") and "linux" in PurePath(path).parts:
        return "pmutil/linux"
    return MODULES.get(target, target.removeprefix("assay_"))


def sources(workshop):
    """The product's sources by their paths in the tree."""
    tree, names, found = workshop.tree, workshop.names, {}
    for entry in json.loads(workshop.commands.read_text()):
        output = PurePath(re.search(r" -o (\S+)", entry["command"]).group(1))
        target = next((part[:-4] for part in output.parts if part.endswith(".dir")), "")
        path = os.path.relpath(entry["file"], tree)
        if path in names and path.split("/")[0] in PRODUCT:
            found[path] = Source(path, module_of(target, path), arguments(entry["command"].replace(
                str(tree), str(workshop.plain))))
    return {**found, **headers(workshop, found)}


def is_here(path):
    """Whether it's a file of the product that this platform may build."""
    return "win" not in path.parts and path.parts[0] not in ("tests", "examples", "benchmarks")


def arguments(command):
    """What clang's parser must be told."""
    words = shlex.split(command)
    kept = [word for word in words if word.startswith(("-I", "-D", "-std="))]
    return kept + [each for before, word in zip(words, words[1:]) if before == "-isystem"
                   for each in (before, word)]


def headers(workshop, found):
    """Each header that sources here include, read by itself as its own source reads it, or else as most
    of the nearest ones that include it."""
    result, includers = {}, {}
    for path in found:
        for name in INCLUDE.findall((workshop.plain / path).read_text()):
            includers.setdefault(PurePath(name).name, []).append((name, found[path]))
    for name in workshop.names:
        path = PurePath(name)
        if path.suffix != ".h" or not is_here(path):
            continue
        # Sources of equal nearness are ordered by how many there are of their module.
        users = [user for included, user in includers.get(path.name, []) if name.endswith(included)]
        count = Counter(user.module for user in users)
        users.sort(key=lambda user: (PurePath(user.path).stem != path.stem,
                                     -len(common(path, PurePath(user.path))), -count[user.module]))
        if users:
            result[name] = Source(name, users[0].module, ["-x", "c++", *users[0].arguments])
    return result


def common(one, other):
    """The folders at the beginning of both paths."""
    return [a for a, b in zip(one.parts, other.parts) if a == b]
