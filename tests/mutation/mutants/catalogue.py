"""All mutants of the sources in scope, kept from run to run by what a source holds."""
import hashlib
import pickle
import sys
from pathlib import Path

from mutants import clang, mutant, sites

# How many mutants a file may have; each file has numbers of its own, so that a changed file leaves
# the numbers in all others as they are.
BLOCK = 4096


class Catalogue:
    def __init__(self, tree, folder):
        self.tree, self.folder = tree, folder
        folder.mkdir(parents=True, exist_ok=True)
        rules = b"".join(Path(module.__file__).read_bytes() for module in (clang, mutant, sites))
        self.rules = hashlib.sha256(rules).digest()
        self.places = folder / "places"
        self.order = self.places.read_text().split("\n") if self.places.exists() else []

    def find(self, source):
        """The mutants of a source, in the order of the text."""
        text = (self.tree / source.path).read_bytes()
        state = hashlib.sha256(self.rules + source.path.encode() + source.module.encode() + text)
        kept = self.folder / f"{state.hexdigest()}.mutants"
        if kept.exists():
            return pickle.loads(kept.read_bytes())
        try:
            unit, cursors = clang.parse(self.tree / source.path, source.arguments)
            found = sites.Finder(source.path, source.module, text).find(cursors)
            del unit
        except ValueError as error:
            print(f"left out: {error}", file=sys.stderr)
            found = []
        found = sorted(found, key=lambda each: (each.start, each.end))[:BLOCK]
        kept.write_bytes(pickle.dumps(found))
        return found

    def number(self, path, index):
        """The number of a file's mutant; 0 is none's."""
        if path not in self.order:
            self.order.append(path)
            self.places.write_text("\n".join(self.order))
        return self.order.index(path) * BLOCK + index + 1

    @property
    def most(self):
        """A number above all numbers."""
        return (len(self.order) + 1) * BLOCK
