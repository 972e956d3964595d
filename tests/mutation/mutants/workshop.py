"""The changed tree and its build."""
import json
import os
import re
import shutil
import subprocess
import sys
from pathlib import Path

from mutants import schemata

HERE = Path(__file__).resolve().parent
ERROR = re.compile(r"(?:from |^|In file included from )([^\s:]+):(\d+)(?::\d+)?[:,]", re.M)
UNIT_TESTS = re.compile(r"[a-z]+_tests")
PROGRAMS = ["assay", "assay-host", "assay-at-root", "assay-host-on-cue", "assay_host_shared"]


def run(command, **options):
    return subprocess.run(command, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                          stderr=subprocess.STDOUT, text=True, errors="replace", check=False, **options)


def must(command):
    done = run(command)
    if done.returncode != 0:
        sys.exit(f"{' '.join(map(str, command))}:\n{done.stdout[-4000:]}")
    return done.stdout


def replace(path, data):
    """Leaves a file alone that is the same, to build less."""
    if not path.exists() or path.read_bytes() != data:
        path.parent.mkdir(parents=True, exist_ok=True)
        path.write_bytes(data)


class Workshop:
    """`folder` holds the plain tree, the changed tree and its build."""

    def __init__(self, origin, folder, jobs):
        self.plain, self.tree, self.build = folder / "plain", folder / "tree", folder / "tree" / "build" / "linux"
        # A test's namespace puts a file system of its own there.
        self.board = folder / "board" / "board"
        self.jobs = jobs
        self.names = self.copy(origin)
        self.refused = folder / "refused.json"
        self.board.parent.mkdir(exist_ok=True)
        self.configure(folder)

    def copy(self, origin):
        """Copies what git knows or would add, as it is at this moment."""
        listed = must(["git", "-C", str(origin), "ls-files", "-co", "--exclude-standard"]).splitlines()
        names = {name for name in listed if (origin / name).is_file()}
        for name in names:
            replace(self.plain / name, (origin / name).read_bytes())
            shutil.copymode(origin / name, self.plain / name)
        for tree in (self.plain, self.tree):
            for path in list(tree.rglob("*")):
                name = path.relative_to(tree)
                if path.is_file() and name.parts[0] != "build" and str(name) not in names:
                    path.unlink()
        return names

    def configure(self, folder):
        for name in self.names:
            # A source may hold mutants of the last run.
            if not (self.tree / name).exists() or not name.endswith((".cpp", ".h")):
                replace(self.tree / name, (self.plain / name).read_bytes())
                shutil.copymode(self.plain / name, self.tree / name)
        os.environ.update(CCACHE_BASEDIR=str(folder), CCACHE_NOHASHDIR="1")
        os.environ.pop("MUTANTS_IN_HEADERS", None)
        chooser = folder / "chooser.o"
        must(["c++", "-O2", "-fPIC", f'-DBOARD="{self.board}"', "-c", str(HERE / "chooser.cpp"),
              "-o", str(chooser)])
        options = ["-DCMAKE_BUILD_TYPE=Debug", "-DCMAKE_CXX_FLAGS_DEBUG=-O0", "-DCMAKE_C_FLAGS_DEBUG=-O0",
                   "-DASSAY_TESTS=ON", f"-DCMAKE_CXX_COMPILER_LAUNCHER={HERE / 'compile'}"]
        options += [f"-DCMAKE_{kind}_LINKER_FLAGS={chooser}" for kind in ("EXE", "MODULE", "SHARED")]
        must(["cmake", "-G", "Ninja", "-S", str(self.tree), "-B", str(self.build), *options])

    @property
    def commands(self):
        return self.build / "compile_commands.json"

    def targets(self):
        known = run(["ninja", "-C", str(self.build), "-t", "targets", "all"]).stdout
        names = {line.split(":")[0] for line in known.splitlines()}
        found = [name for name in names if name.startswith("scripted_") or UNIT_TESTS.fullmatch(name)]
        return sorted(found) + [name for name in [*PROGRAMS, "test_child"] if name in names]

    def make(self, targets, keep_going=False):
        """(whether all was built, what the build said)."""
        command = ["ninja", "-C", str(self.build), f"-j{self.jobs}", *(["-k0"] if keep_going else []), *targets]
        done = run(command)
        return done.returncode == 0, done.stdout

    def write(self, numbered, refused):
        """Gives each file its mutants, without those that must stand alone; the others are plain."""
        if any(mutants and name.endswith(".h") for name, mutants in numbered.items()):
            os.environ["MUTANTS_IN_HEADERS"] = "1"
        for name in self.names:
            text = (self.plain / name).read_bytes()
            chosen = [(number, each) for number, each in numbered.get(name, [])
                      if each.form != "alone" and each.name not in refused]
            replace(self.tree / name, schemata.Writer(text, chosen).write() if chosen else text)

    def prepare(self, numbered):
        """Builds all tests with all mutants that can be in one program. Returns the names of those
        that can't."""
        refused = set(json.loads(self.refused.read_text())) if self.refused.exists() else set()
        while True:
            self.write(numbered, refused)
            built, output = self.make(self.targets(), keep_going=True)
            if built:
                return refused
            more = self.blame(output, numbered, refused)
            if not more:
                sys.exit(f"the tree doesn't build, and no mutant is the cause:\n{output[-6000:]}")
            print(f"{len(more)} mutants must be built alone", file=sys.stderr, flush=True)
            refused |= more
            self.refused.write_text(json.dumps(sorted(refused)))

    def blame(self, output, numbered, refused):
        """The mutants at the lines that the compiler's errors name, or, if there are none, those at the
        lines that lead to the errors, or those that turned constants into variables, or change numbers,
        or all of the files that are named."""
        more = set()
        for failed in re.split(r"^FAILED: ", output, flags=re.M)[1:]:
            errors, others = self.places(failed)
            here = {path: [(number, each) for number, each in numbered.get(path, [])
                           if each.form != "alone" and each.name not in refused] for path, _ in errors | others}
            near = [{each.name for path, line in places for _, each in here[path]
                     if line in self.lines(path, each)} for places in (errors, others)]
            constants = {each.name for mutants in here.values() for _, each in mutants if each.relaxed}
            numbers = {each.name for mutants in here.values() for _, each in mutants if each.kind == "constant"}
            every = {each.name for mutants in here.values() for _, each in mutants}
            more |= near[0] or near[1] or constants or numbers or every
        return more

    def lines(self, path, mutant):
        text = (self.plain / path).read_bytes()
        first = text.count(b"\n", 0, mutant.outer[0]) + 1
        # A statement is still there; only what an expression became can be wrong.
        last = first if mutant.form == "statement" else text.count(b"\n", 0, mutant.outer[1]) + 1
        return range(first, last + 1)

    def places(self, failed):
        """Where errors are, and the places that only lead to them: (path, line) of the tree."""
        found = {"error": set(), "other": set()}
        for line in failed.splitlines():
            for match in ERROR.finditer(line):
                path = Path(match.group(1))
                path = path if path.is_absolute() else self.build / path
                try:
                    name = str(Path(os.path.normpath(path)).relative_to(self.tree))
                except ValueError:
                    continue
                if name in self.names:
                    found["error" if " error: " in line else "other"].add((name, int(match.group(2))))
        return found["error"], found["other"]

    def alone(self, mutant):
        """Writes one mutant into the plain text of its file."""
        text = (self.plain / mutant.path).read_bytes()
        start, end = mutant.outer
        changed = mutant.changed(text)
        # The lines behind it stay where they are.
        changed += b"\n" * text.count(b"\n", start, end)
        replace(self.tree / mutant.path, text[:start] + changed + text[end:])

    def restore(self, path, text):
        replace(self.tree / path, text)
