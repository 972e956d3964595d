"""What is in a built program or library, from the linker's map and the compiler's lists of headers."""

import re
import subprocess
from functools import lru_cache
from pathlib import Path

STATIC, CODE, DYNAMIC, HEADER = "linked statically", "compiled", "linked dynamically", "included"
MEMBER = re.compile(r"^(\S+(?: \S+)*\.a)\(([^()]+)\)(?:\s|$)")
ELF, PE, ARCHIVE = b"\x7fELF", b"MZ", b"!<arch>\n"


def output_of(*command, cwd=None):
    return subprocess.run(command, cwd=cwd, check=True, stdout=subprocess.PIPE).stdout.decode()


def starts_with(file, magic):
    with open(file, "rb") as opened:
        return opened.read(len(magic)) == magic


def is_linked(file):
    """Whether it is a program, a shared library or a static one. Import libraries have no code."""
    return file.is_file() and not file.is_symlink() and not file.name.endswith(".dll.a") and any(
        starts_with(file, magic) for magic in (ELF, PE, ARCHIVE))


def dynamic_values(file, tag):
    return re.findall(rf"\({tag}\).*\[(.*)\]",
                      output_of("readelf", "--wide", "--dynamic", file))


class Build:
    """A build folder of Ninja, in which everything is built."""

    def __init__(self, folder):
        self.folder = Path(folder).resolve()
        self.outputs = {}
        for line in self.ninja("targets", "all").splitlines():
            path, _, rule = line.rpartition(": ")
            if re.match(r"(C|CXX)_\w+_LINKER__", rule):
                self.outputs[Path(path).name] = path

    def ninja(self, *tool):
        return output_of("ninja", "-t", *tool, cwd=self.folder)

    def files_in(self, name):
        """What the output of this file name is made of: (path, how it gets in) for each file that is
        not built here. KeyError if no output has this name."""
        path = self.outputs[name]
        if path.endswith(".a"):
            return self.files_of(self.inputs(path))
        objects, found = self.read_map(name)
        found |= self.files_of(objects)
        if starts_with(self.folder / path, ELF):
            found |= self.needed(path)
        return found

    @lru_cache(maxsize=None)
    def inputs(self, archive):
        lines = self.ninja("query", archive).splitlines()
        return {line.strip() for line in lines if re.match(r" {4}\S", line)
                and re.search(r"\.(o|obj)$", line)}

    def map_lines(self, name):
        """The lines of the map up to the first section. Those with something on the left are of files."""
        loads = False
        with open(self.folder / "link-maps" / f"{name}.map", encoding="utf-8") as lines:
            for line in lines:
                if line[0] in " \n":
                    continue
                loads = loads or line.startswith("LOAD ")
                if loads and line.startswith("."):
                    return
                yield line

    def read_map(self, name):
        """The objects that are built here, and (path, STATIC) of the others that were linked."""
        members, loaded = set(), set()
        for line in self.map_lines(name):
            member = MEMBER.match(line) if not loaded else None
            if member:
                members.add(member.groups())
            elif line.startswith("LOAD "):
                loaded.add(line[len("LOAD "):].rstrip("\n"))
        objects, found = set(), set()
        for file in loaded:
            if re.search(r"\.(o|obj)$", file):
                self.sort(file, objects, found)
        for archive, member in members:
            if Path(archive).name in self.outputs:
                objects |= {each for each in self.inputs(self.relative(archive))
                            if Path(each).name == member}
            else:
                found.add((self.absolute(archive), STATIC))
        return objects, found

    def sort(self, file, objects, found):
        if self.is_built_here(file):
            objects.add(self.relative(file))
        else:
            found.add((self.absolute(file), STATIC))

    @lru_cache(maxsize=None)
    def absolute(self, file):
        return (self.folder / file).resolve()

    def is_built_here(self, file):
        return self.folder in self.absolute(file).parents

    def relative(self, file):
        return str(self.absolute(file).relative_to(self.folder))

    def files_of(self, objects):
        """The sources and headers that the objects were compiled from."""
        compiled = sorted(each for each in objects if ".rc." not in each)
        found = set()
        source = False
        for line in self.ninja("deps", *compiled).splitlines() if compiled else []:
            if "deps not found" in line:
                raise LookupError(f"the build doesn't know the headers of {line}")
            if line.startswith("    "):
                found.add((line.strip(), STATIC if source else HEADER))
            source = not line.startswith("    ")
        return {(self.absolute(file), way) for file, way in found}

    def needed(self, path):
        """(path, DYNAMIC) for each shared library that the output requires at its start."""
        wanted = set(dynamic_values(self.folder / path, "NEEDED"))
        names = {}
        for line in self.map_lines(Path(path).name):
            if line.startswith("LOAD ") and ".so" in line:
                file = self.absolute(line[len("LOAD "):].rstrip("\n"))
                if starts_with(file, ELF):
                    names.update((name, file) for name in dynamic_values(file, "SONAME"))
        missing = wanted - names.keys()
        if missing:
            raise LookupError(f"the map of {path} doesn't have {', '.join(sorted(missing))}")
        return {(names[name], DYNAMIC) for name in wanted if not self.is_built_here(names[name])}
