# SPDX-License-Identifier: MIT
"""The short form: mutants of the portable base, each compiled by itself and linked natively with
what has been built of the tree. Nothing of the tree or its build folder is changed.
"""

import json
import shlex
import subprocess
from pathlib import Path

from sites import Site
from workplace import FAIL_FAST, Outcome, failure_of

PROGRAM = "bin/core_tests"
SECONDS = 30  # for one run of it


class NativePlace:
    def __init__(self, build: Path, scratch: Path):
        self.build = build
        self.scratch = scratch
        scratch.mkdir(parents=True, exist_ok=True)
        entries = json.loads((build / "compile_commands.json").read_text())
        commands = ((entry["file"], entry["command"]) for entry in entries)
        self.commands = {file: line for file, line in commands if "/core_tests.dir/" in line}
        listing = ("ninja", "-C", str(build), "-t", "commands", PROGRAM)
        steps = subprocess.run(listing, check=True, capture_output=True, text=True).stdout
        self.link = steps.splitlines()[-1]

    def takes(self, tree: Path, site: Site) -> bool:
        return str(tree / site.file) in self.commands

    def judge(self, tree: Path, site: Site) -> Outcome:
        source, mutated = tree / site.file, self.scratch / "mutated.cpp"
        mutated.write_bytes(site.apply(source.read_bytes()))
        command = shlex.split(self.commands[str(source)])
        target = command[command.index("-o") + 1]
        built, program = f"{mutated}.o", self.scratch / "core_tests"
        swapped = {str(source): str(mutated), target: built}
        compiled = [swapped.get(word, word) for word in command]
        linked = self.link.replace(target, built).replace(f"-o {PROGRAM}", f"-o {program}")
        for step in (compiled, ["sh", "-c", linked]):
            if subprocess.run(step, cwd=self.build, capture_output=True).returncode:
                return Outcome("refused")
        run = ("timeout", "-k", "5", str(SECONDS), str(program), FAIL_FAST)
        tested = subprocess.run(run, cwd=self.scratch, capture_output=True)
        if not tested.returncode:
            return Outcome("SURVIVED")
        output = tested.stdout.decode(errors="replace")
        return Outcome("killed", f"core.native: {failure_of(tested.returncode, output)}")
