"""Tries mutants: those that share one program side by side, then the others, each built alone."""
import sys
from concurrent.futures import ThreadPoolExecutor
from pathlib import Path

from mutants import isolation

# Programs of which any may hold a mutant that no survey saw.
NEVER = 7200


class Trial:
    def __init__(self, workshop, survey, numbered, refused, judgements, folder, budget):
        self.workshop, self.survey, self.numbered, self.refused = workshop, survey, numbered, refused
        self.judgements, self.folder, self.budget = judgements, folder, budget

    def run(self, chosen):
        """(mutant, outcome) of each (number, mutant), as they become known."""
        together, alone = [], []
        for number, mutant in chosen:
            reason = self.judgements.reason(mutant)
            if reason is not None:
                yield mutant, {"verdict": "equivalent", "reason": reason}
            elif mutant.form == "alone" or mutant.name in self.refused:
                alone.append(mutant)
            else:
                together.append((number, mutant))
        with ThreadPoolExecutor(self.workshop.jobs) as pool:
            yield from zip([mutant for _, mutant in together],
                           pool.map(lambda item: self.attempt(item[0], [item[0]]), together))
        for mutant in alone:
            yield mutant, self.alone(mutant)
        if alone and not self.workshop.make(self.workshop.targets())[0]:
            sys.exit("the tree no longer builds without the mutants that were built alone")

    def attempt(self, number, reach):
        steps = self.survey.steps(reach, self.budget)
        if not steps:
            return {"verdict": "not reached"}
        job = self.survey.job(what="attempt", number=number, steps=steps)
        result, output = isolation.run(job, self.folder, NEVER)
        # A mutant that ends its own tests is caught too.
        return result or {"verdict": "killed", "by": "no result", "how": output[-300:]}

    def alone(self, mutant):
        """Builds what the mutant needs with it, tries it and restores the file."""
        text = (self.workshop.tree / mutant.path).read_bytes()
        steps = self.survey.steps(self.near(mutant), self.budget)
        programs = dict.fromkeys(Path(program).name for program, _ in steps)
        targets = [each for each in programs if each != "program"]
        if "program" in programs:
            targets += [each for each in self.workshop.targets() if not each.endswith("_tests")]
        self.workshop.alone(mutant)
        try:
            if not targets:
                return {"verdict": "not reached"}
            built, output = self.workshop.make(targets)
            if not built:
                return {"verdict": "did not build", "how": output[-600:]}
            return self.attempt(0, self.near(mutant))
        finally:
            self.workshop.restore(mutant.path, text)

    def near(self, mutant):
        """The numbers of the mutants by which to tell which tests reach this one: those of the same
        function, or else of the same file, or else of the same module."""
        others = [(number, each) for number, each in self.numbered[mutant.path]
                  if each.form != "alone" and each.name not in self.refused]
        function = [number for number, each in others if mutant.function and each.function == mutant.function]
        return function or [number for number, _ in others] or [
            number for mutants in self.numbered.values() for number, each in mutants
            if each.module == mutant.module]
