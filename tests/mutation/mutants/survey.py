"""Which mutants each test asks for while none is on, and how long it takes; kept for each program until
it or its tests change."""
import hashlib
import json
import re
import sys
from concurrent.futures import ThreadPoolExecutor
from dataclasses import dataclass
from pathlib import Path

from mutants import isolation
from mutants.workshop import UNIT_TESTS, run

# Cases of one job: the jobs go on side by side.
CHUNK = 100
# Stands for the tests of whole programs, beside the paths of the programs of unit tests.
PROGRAM = "program"


@dataclass
class ProgramTests:
    """Which tests of whole programs are used: those of all files but some, that end in time."""

    without: list  # names of files
    slowest: float  # seconds, or None

    def files(self, tree):
        found = sorted((tree / "tests" / "program").glob("test_*.py"))
        unknown = set(self.without) - {path.name for path in found}
        if unknown:
            sys.exit(f"run_mutants: no program tests are named {', '.join(sorted(unknown))}")
        return [str(path) for path in found if path.name not in self.without]


class Survey:
    """`program_tests` is None to use unit tests alone."""

    def __init__(self, workshop, folder, size, program_tests):
        self.workshop, self.folder, self.size = workshop, folder, size
        self.program_tests = program_tests
        self.files = program_tests.files(workshop.tree) if program_tests else []
        self.cases = {}  # program: {case: {"seconds", "reached"}}

    def job(self, **more):
        shop = self.workshop
        return {"board": str(shop.board), "size": self.size, "tree": str(shop.tree),
                "build": str(shop.build), "program_tests": self.files, **more}

    def states(self):
        """What the survey of each program of unit tests, and that of the program tests, depends on."""
        folder = self.workshop.build / "bin"
        others = hashlib.sha256()
        for path in [*sorted(folder.glob("*")), *sorted(self.workshop.build.glob("lib*/*.so"))]:
            if not UNIT_TESTS.fullmatch(path.name):
                others.update(path.read_bytes())
        states = {str(path): digest(others, [path]) for path in sorted(folder.glob("*_tests"))}
        if self.program_tests:
            others.update(repr(self.program_tests).encode())
            tests = sorted((self.workshop.tree / "tests" / "program").glob("*.py"))
            states[PROGRAM] = digest(others, tests)
        return states

    def take(self):
        kept = self.folder / "survey.json"
        old = json.loads(kept.read_text()) if kept.exists() else {}
        found = dict(old)
        with ThreadPoolExecutor(self.workshop.jobs) as pool:
            for name, state in self.states().items():
                if old.get(name, {}).get("state") != state:
                    found[name] = {"state": state, "cases": [pool.submit(self.look, job) for job in self.parts(name)]}
            for name, survey in found.items():
                if isinstance(survey["cases"], list):
                    survey["cases"] = usable(name, [job.result() for job in survey["cases"]])
                    # Those that are still to come are no part of the file.
                    kept.write_text(json.dumps({name: each for name, each in found.items()
                                                if isinstance(each["cases"], dict)}))
        self.cases = {name: found[name]["cases"] for name in self.states()}

    def parts(self, name):
        """The jobs by which to survey one program."""
        if name == PROGRAM:
            for file in self.files:
                yield {**self.job(what="survey", programs={}, slowest=self.program_tests.slowest),
                       "program_tests": [file]}
            return
        cases = list_cases(Path(name))
        for start in range(0, len(cases), CHUNK):
            yield {**self.job(what="survey", programs={name: cases[start:start + CHUNK]}), "program_tests": []}

    def look(self, job):
        result, output = isolation.run(job, self.folder, 3600)
        if result is None:
            sys.exit(f"the tests end without a result where no mutant is on:\n{output}")
        return result

    def steps(self, numbers, budget):
        """(program, {case: seconds}) for the tests that ask for any of these mutants: the unit tests
        of the program that asks most first, quick cases before slow ones; then the program tests, as
        many of the quickest of each file as `budget` seconds hold."""
        numbers = set(numbers)
        found = []
        for program, cases in self.cases.items():
            asking = {case: each["seconds"] for case, each in cases.items()
                      if not numbers.isdisjoint(each["reached"])}
            if program != "program" and asking:
                found.append((len(asking) / len(cases), program, asking))
        steps = []
        for _, program, asking in sorted(found, reverse=True):
            quick = {case: seconds for case, seconds in asking.items() if seconds < 0.3}
            slow = {case: seconds for case, seconds in asking.items() if seconds >= 0.3}
            steps += [(program, part) for part in (quick, slow) if part]
        asking = {case: each["seconds"] for case, each in self.cases.get("program", {}).items()
                  if not numbers.isdisjoint(each["reached"])}
        chosen = within_budget(asking, budget)
        return steps + ([("program", chosen)] if chosen else [])


def digest(others, paths):
    state = others.copy()
    for path in paths:
        state.update(path.read_bytes())
    return state.hexdigest()


def usable(name, results):
    """The cases of a program's jobs that pass."""
    cases = {case: found for result in results for each in result.values() for case, found in each.items()}
    for case in [case for case, found in cases.items() if not found["passed"]]:
        print(f"not used, fails without a mutant: {Path(name).name} {case}", file=sys.stderr)
        del cases[case]
    return cases


def within_budget(seconds, budget):
    """The quickest case of each file, then the second quickest, until the budget is spent."""
    files = {}
    for case in sorted(seconds, key=seconds.get):
        files.setdefault(case.split("::")[0], []).append(case)
    rounds = [case for rank in range(max(map(len, files.values()), default=0))
              for case in (cases[rank] for cases in files.values() if rank < len(cases))]
    chosen, spent = {}, 0.0
    for case in rounds:
        if spent + seconds[case] <= budget:
            chosen[case] = seconds[case]
            spent += seconds[case]
    return chosen


def list_cases(program):
    """All cases of a GoogleTest program, as SUITE.NAME."""
    suite, cases = "", []
    for line in run([str(program), "--gtest_list_tests"]).stdout.splitlines():
        name = line.split("#")[0].rstrip()
        if re.fullmatch(r"[\w/]+\.", name):
            suite = name
        elif re.fullmatch(r"  [\w/]+", name) and "DISABLED_" not in name:
            cases.append(suite + name.strip())
    return cases
