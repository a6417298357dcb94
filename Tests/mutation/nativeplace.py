# SPDX-License-Identifier: MIT
"""The short form: mutants of the portable base, each compiled by itself and linked natively with
what has been built of the tree. Nothing of the tree or its build folder is changed.
"""

import json
import os
import shlex
import subprocess
import time
from pathlib import Path

from sites import Site
from workplace import FAIL_FAST, BuildFailed, Outcome, failure_of, limit_files

PROGRAM = "bin/core_tests"


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
        self.limit = 600.0  # seconds, for one run
        began = time.monotonic()
        failed = self._run(build / PROGRAM)
        if failed:
            raise BuildFailed(f"{PROGRAM} fails without any mutation: {failed}")
        self.limit = 10 + 5 * (time.monotonic() - began)

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
        linked = self.link
        for old, new in ((f" {target} ", f" {built} "), (f"-o {PROGRAM} ", f"-o {program} ")):
            if linked.count(old) != 1:
                raise BuildFailed(f"no{old} in how {PROGRAM} is linked: {self.link}")
            linked = linked.replace(old, new)
        for step in (compiled, ["sh", "-c", linked]):
            if subprocess.run(step, cwd=self.build, capture_output=True).returncode:
                return Outcome("refused")
        failed = self._run(program)
        return Outcome("killed", f"core.native: {failed}") if failed else Outcome("SURVIVED")

    def _run(self, program: Path) -> str:
        """What failed, empty when nothing did."""
        log = self.scratch / "output.txt"
        with log.open("wb") as output:
            status = subprocess.run(
                ("timeout", "-k", "5", f"{self.limit:.0f}", str(program), FAIL_FAST),
                cwd=self.scratch,
                env={**os.environ, "CORE_TEST_SEED": "1"},
                stdout=output,
                stderr=output,
                preexec_fn=limit_files,
            ).returncode
        return failure_of(status, log.read_text(errors="replace")) if status else ""
