# SPDX-License-Identifier: MIT
"""Mutates the module's sources, one place at a time, and tells which mutants the tests catch.

Run by scripts/mutate.sh and, in its short form, by ctest. A mutant that the compiler refuses, or
that makes the same DLL and the same objects of the tests, does not count. One that all tests pass has
survived. Of the mutants that survivors.txt does not explain, at least 95 % must be caught.

The short form has mutants of the portable base only and builds it natively, where an object says
nothing about whether it is the same. Half of its few mutants are enough.
"""

import argparse
import random
import secrets
import signal
import sys
import time
from collections import Counter
from collections.abc import Callable, Iterable
from pathlib import Path

from nativeplace import NativePlace
from sites import Finder, Site
from workplace import BuildFailed, Outcome, Workplace

SURVIVORS = "Tests/mutation/survivors.txt"
WANTED_SHARE = 0.95
# Of the few of the short form; enough to know that its parts work together.
WANTED_SHARE_IN_SHORT = 0.5
COUNTED = ("killed", "SURVIVED")


def parse_arguments() -> argparse.Namespace:
    parser = argparse.ArgumentParser(prog="scripts/mutate.sh", description=__doc__)
    add = parser.add_argument
    add("count", nargs="?", type=positive, default=200, help="mutants that count (default: 200)")
    add("seed", nargs="?", type=int, help="of the random choice (default: a new one, printed)")
    add("--only", nargs="+", metavar="MUTANT", help="these, by number or as FILE:LINE[:KIND]")
    add("--list", action="store_true", help="print all mutants and test none")
    for path in ("root", "work"):
        add(f"--{path}", required=True, type=Path, help=argparse.SUPPRESS)
    for path in ("cruby", "pcre2"):
        add(f"--{path}", help=argparse.SUPPRESS)
    # The portable base only, with what this build folder of the tree itself has.
    add("--short", type=Path, help=argparse.SUPPRESS)
    return parser.parse_args()


def positive(text: str) -> int:
    number = int(text)
    if number < 1:
        raise argparse.ArgumentTypeError("at least 1 is needed")
    return number


def read_survivors(path: Path) -> dict[tuple[str, ...], str]:
    """Keys of sites, and why nobody can see the change."""
    explained = {}
    for block in path.read_text().split("\n\n"):
        lines = [line for line in block.splitlines() if not line.startswith("#")]
        if not lines:
            continue
        file, _, place = lines[0].partition(", ")
        before = [line[2:] for line in lines if line.startswith("- ")]
        after = [line[2:] for line in lines if line.startswith("+ ")]
        reason = " ".join(lines[1 + len(before) + len(after) :])
        if not before or len(before) != len(after) or not reason:
            raise SystemExit(f"error: {path}: not file, place, -, + and reason: {lines[0]}")
        explained |= {(file, place, *change): reason for change in zip(before, after)}
    return explained


def describe(number: int, site: Site) -> str:
    return f"{number:5} {site.file}:{site.line} {site.kind}"


def entry_of(site: Site) -> str:
    return f"{site.file}, {site.place}\n- {site.before}\n+ {site.after}"


def choose(names: list[str], sites: list[Site]) -> list[int]:
    chosen = []
    for name in names:
        matching = [number for number, site in enumerate(sites, 1) if is_named(name, number, site)]
        if not matching:
            raise SystemExit(f"error: no mutant: {name} (--list shows all)")
        chosen += matching
    return chosen


def is_named(name: str, number: int, site: Site) -> bool:
    file, *rest = name.split(":")
    if not rest:
        return name == str(number)
    return site.file.endswith(file) and [str(site.line), site.kind][: len(rest)] == rest


def shuffle(sites: list[Site], seed: int) -> list[int]:
    """All mutants in random order, but one of each file first."""
    numbers = random.Random(seed).sample(range(1, len(sites) + 1), len(sites))
    first = {sites[number - 1].file: number for number in reversed(numbers)}
    return sorted(numbers, key=lambda number: first[sites[number - 1].file] != number)


class Session:
    """Tests mutants and counts what became of them."""

    def __init__(self, judge: Callable[[Site, int], Outcome], sites: list[Site], explained: dict):
        self.judge = judge
        self.sites = sites
        self.explained = explained
        self.verdicts: Counter[str] = Counter()
        self.killers: Counter[str] = Counter()
        self.unexplained = 0
        self.files: set[str] = set()

    def counted(self) -> int:
        return sum(self.verdicts[verdict] for verdict in COUNTED)

    def test(self, number: int) -> None:
        site = self.sites[number - 1]
        began = time.monotonic()
        outcome = self.judge(site, number)
        self.verdicts[outcome.verdict] += 1
        if outcome.verdict in COUNTED:
            self.files.add(site.file)
        seconds = time.monotonic() - began
        line = f"{describe(number, site)} {outcome.verdict}"
        if outcome.verdict == "killed":
            self.killers[outcome.by.split(":")[0]] += 1
            line += f" by {outcome.by}"
        if outcome.verdict == "SURVIVED":
            line += self._explain(site)
        elif site.key() in self.explained:
            line += f"\n      {SURVIVORS} calls it a survivor"
        print(f"{line} ({seconds:.1f} s)", flush=True)

    def _explain(self, site: Site) -> str:
        if site.key() in self.explained:
            return f" ({self.explained[site.key()]})"
        self.unexplained += 1
        return " UNEXPLAINED\n" + entry_of(site) + "\n      "

    def report(self) -> float:
        """The share that was killed of those that can be."""
        killed = self.verdicts["killed"]
        share = killed / max(1, killed + self.unexplained)
        killers = ", ".join(f"{name} {count}" for name, count in self.killers.most_common())
        print(f"""
figure: {self.counted()} mutants of {len(self.files)} files: {killed} killed, \
{self.verdicts["SURVIVED"] - self.unexplained} explained, {self.unexplained} survived: \
{share:.1%} of those that can be killed
figure: killed by {killers or "none"}
figure: besides, {self.verdicts["refused"]} were refused by the compiler and \
{self.verdicts["same"]} changed nothing in what it made""")
        return share


def find_sites(tree: Path, build: Path, explained: dict) -> list[Site]:
    sites = Finder(tree).find(build / "compile_commands.json")
    for key in explained.keys() - {site.key() for site in sites}:
        raise SystemExit(f"error: {SURVIVORS} has a mutant that does not exist: " + ", ".join(key))
    return sites


def test_at_random(session: Session, options: argparse.Namespace, numbers: Iterable[int]) -> float:
    for number in numbers:
        if session.counted() == options.count:
            break
        session.test(number)
    return session.report()


def test_in_short(options: argparse.Namespace, explained: dict) -> int:
    sites = find_sites(options.root, options.short, explained)
    place = NativePlace(options.short / "native", options.work)
    session = Session(lambda site, _: place.judge(options.root, site), sites, explained)
    numbers = (n for n in shuffle(sites, options.seed) if place.takes(options.root, sites[n - 1]))
    return 0 if test_at_random(session, options, numbers) >= WANTED_SHARE_IN_SHORT else 1


def main() -> int:
    options = parse_arguments()
    explained = read_survivors(options.root / SURVIVORS)
    if options.seed is None:
        options.seed = secrets.randbelow(1 << 32)
    if options.short:
        return test_in_short(options, explained)
    place = Workplace(options.root, options.work)
    place.copy_tree(options.cruby, options.pcre2)
    sites = find_sites(place.tree, place.build("release"), explained)
    if options.list:
        for number, site in enumerate(sites, 1):
            print(f"{describe(number, site)}\n{entry_of(site)}")
        return 0
    chosen = choose(options.only, sites) if options.only else []

    place.build_original()
    session = Session(place.judge, sites, explained)
    if chosen:
        for number in chosen:
            session.test(number)
        session.report()
        return 1 if session.unexplained else 0
    print(f"{options.count} of {len(sites)} mutants, seed {options.seed}", flush=True)
    share = test_at_random(session, options, shuffle(sites, options.seed))
    return 0 if share >= WANTED_SHARE else 1


if __name__ == "__main__":
    signal.signal(signal.SIGTERM, signal.default_int_handler)  # tidies up as after Ctrl-C
    try:
        sys.exit(main())
    except BuildFailed as failure:
        sys.exit(f"error: {failure}")
    except KeyboardInterrupt:
        sys.exit(130)
