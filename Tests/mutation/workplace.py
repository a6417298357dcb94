# SPDX-License-Identifier: MIT
"""The copy of the source tree in which mutants are built and tested.

The tree that the copy was made of is only read. After each mutant the copy's source and everything
that was built of it are put back with their old times, so the next build starts from the original.
"""

import json
import os
import re
import resource
import shutil
import subprocess
import time
from collections.abc import Iterator
from contextlib import contextmanager
from dataclasses import dataclass, field
from pathlib import Path

from sites import Site

FAIL_FAST = "--gtest_fail_fast"
LARGEST_FILE = 5 << 30  # a mutant may write for ever; a test makes one of 4 GiB
ABI_TABLES = "Tests/abi/tables.txt"
DLL = "bin/scriptruby.dll"
TRAPPING_DLL = "bin/trapping/scriptruby.dll"
# What is made of the module's sources, in the two build folders.
MODULE_OBJECTS = "Scripting/scriptruby/CMakeFiles/*.dir/**/*.obj"
TRAPPING_OBJECTS = "Tests/torture/CMakeFiles/trapping_objects.dir/**/*.obj"
CORE_OBJECTS = "Tests/core/CMakeFiles/core_tests.dir/**/*.obj"
OUTPUTS = {
    "release": (MODULE_OBJECTS, CORE_OBJECTS, TRAPPING_OBJECTS, DLL, TRAPPING_DLL, ABI_TABLES,
                "bin/core_tests.exe"),
    "sanitize": ("Tests/core/CMakeFiles/core_tests.dir/**/*.o", "bin/core_tests"),
}
TARGETS = ("scriptruby", "core_tests", "abi_tables")
BOX_TEST = "VersionTest.HeadersAndHostFolders"


@dataclass(frozen=True)
class Stage:
    """A run of a test program."""

    name: str
    needs: str  # what must have changed: core or module
    command: tuple[str, ...]
    environment: dict[str, str] = field(default_factory=dict)
    build: tuple[str, str] | None = None  # preset and target that only this one needs


@dataclass
class Outcome:
    verdict: str  # refused, same, killed or SURVIVED
    by: str = ""


class BuildFailed(Exception):
    pass


class Workplace:
    def __init__(self, root: Path, folder: Path):
        self.root = root
        self.folder = folder
        self.tree = folder / "tree"
        self.kept = folder / "original"
        self.logs = folder / "logs"
        self.scratch = folder / "scratch"
        self.libraries = folder / "libraries.txt"  # that the copy is configured with
        self.stamp = folder / "seconds.json"  # of each stage; there when the original passes all
        self.seconds: dict[str, float] = {}
        self.stages = self._make_stages()

    def _make_stages(self) -> list[Stage]:
        """The fastest first. The seeds make each test the same one whenever it runs."""
        binaries = self.build("release") / "bin"
        core = ("wine", str(binaries / "core_tests.exe"), FAIL_FAST)
        module = ("wine", str(binaries / "module_tests.exe"), FAIL_FAST)
        torture = ("wine", str(binaries / "torture_tests.exe"), FAIL_FAST, "--gtest_filter=-Ruby*")
        native = (str(self.build("sanitize") / "bin/core_tests"), FAIL_FAST)
        abi = self.tree / "Tests/abi"
        tables = ("diff", str(abi / "tables.txt"), str(self.build("release") / ABI_TABLES))
        dll = (str(abi / "check-dll.sh"), str(self.build("release") / DLL))
        seed, torture_seed = {"CORE_TEST_SEED": "1"}, {"SCRIPTRUBY_TORTURE_SEED": "1"}
        few = {"SCRIPTRUBY_TEST_FAULTS": "20"}
        quick, slow = f"-RubyTest.*:{BOX_TEST}", f"RubyTest.*:{BOX_TEST}"
        trap = {"SCRIPTRUBY_TEST_DLL": str(self.build("release") / TRAPPING_DLL), **few}
        return [
            Stage("core_tests", "core", core, seed),
            Stage("module_tests", "module", (*module, f"--gtest_filter={quick}"), few),
            Stage("abi.tables", "module", tables),
            Stage("abi.dll", "module", dll),
            Stage("core.native", "core", native, seed, ("sanitize", "core_tests")),
            Stage("module_tests", "module", (*module, f"--gtest_filter={slow}"), few),
            Stage("torture_tests", "module", torture, torture_seed),
            Stage("module.trapping", "module", (*module, f"--gtest_filter={quick}"), trap,
                  ("release", "scriptruby_trapping")),
        ]

    def build(self, preset: str) -> Path:
        return self.tree / "build" / preset

    # --- The original ----------------------------------------------------------------------------

    def copy_tree(self, cruby: str, pcre2: str) -> None:
        """Makes the copy, or brings it up to date, and configures it with these libraries."""
        for folder in (self.tree, self.logs, self.scratch):
            folder.mkdir(parents=True, exist_ok=True)
        self._copy_files()
        libraries = f"{cruby}\n{pcre2}\n"
        if not self.libraries.exists() or self.libraries.read_text() != libraries:
            self.stamp.unlink(missing_ok=True)
            self._configure(cruby, pcre2)
            self.libraries.write_text(libraries)

    def build_original(self) -> None:
        """Builds the original and, unless that is known, makes sure that it passes."""
        self._ninja("release", *TARGETS, "module_tests", "torture_tests", "rubyscript")
        for stage in self.stages:
            self._build_for(stage)
        self._keep_outputs()
        if not self.stamp.exists():
            self.stamp.write_text(json.dumps(self._check_original()))
        self.seconds = json.loads(self.stamp.read_text())

    def _copy_files(self) -> None:
        """Files that are the same keep their times; what no build reads stays out."""
        harness = (f"Tests/mutation/{name}" for name in ("*.py", "survivors.txt"))
        left_out = (f"--exclude=/{name}" for name in ("build", ".git", "Docs", *harness))
        command = ("rsync", "-rlpci", "--delete", *left_out, f"{self.root}/", f"{self.tree}/")
        if subprocess.run(command, check=True, capture_output=True).stdout:
            self.stamp.unlink(missing_ok=True)

    def _configure(self, cruby: str, pcre2: str) -> None:
        libraries = (f"-DSCRIPTRUBY_CRUBY={cruby}", f"-DSCRIPTRUBY_PCRE2={pcre2}")
        # Without the time of its linking, a DLL of the same objects is the same.
        linking = {"LDFLAGS": "-Wl,--no-insert-timestamp"}
        for preset, settings, extra in (("release", libraries, linking), ("sanitize", (), {})):
            command = ("cmake", "-S", str(self.tree), "--preset", preset, "--fresh", *settings)
            subprocess.run(command, check=True, stdout=subprocess.DEVNULL, env=os.environ | extra)

    def _keep_outputs(self) -> None:
        shutil.rmtree(self.kept, ignore_errors=True)
        for preset in OUTPUTS:
            for file in self._outputs(preset):
                copy = self._kept(file)
                copy.parent.mkdir(parents=True, exist_ok=True)
                shutil.copy2(file, copy)

    def _check_original(self) -> dict[str, float]:
        seconds = {}
        for number, stage in enumerate(self.stages):
            began = time.monotonic()
            failed = self._run(stage, 600, self.logs / "original.txt")
            if failed:
                raise BuildFailed(f"{stage.name} fails without any mutation: {failed}")
            seconds[str(number)] = time.monotonic() - began
        return seconds

    def _outputs(self, preset: str) -> Iterator[Path]:
        for pattern in OUTPUTS[preset]:
            yield from self.build(preset).glob(pattern)

    def _kept(self, file: Path) -> Path:
        return self.kept / file.relative_to(self.tree)

    # --- A mutant --------------------------------------------------------------------------------

    def judge(self, site: Site, number: int) -> Outcome:
        log = self.logs / f"{number}.txt"
        log.unlink(missing_ok=True)
        with self._mutated(site):
            try:
                self._ninja("release", *TARGETS, log=log)
                changed = self._changes()
                if not changed:
                    return Outcome("same")
                return self._test(changed, log)
            except BuildFailed:
                return Outcome("refused")

    @contextmanager
    def _mutated(self, site: Site) -> Iterator[None]:
        source = self.tree / site.file
        original, times = source.read_bytes(), source.stat()
        source.write_bytes(site.apply(original))
        try:
            yield
        finally:
            source.write_bytes(original)
            os.utime(source, ns=(times.st_atime_ns, times.st_mtime_ns))
            self._restore()
            self._clean_up()

    def _restore(self) -> None:
        for copy in self.kept.rglob("*"):
            file = self.tree / copy.relative_to(self.kept)
            if copy.is_file() and not (file.exists() and _same_file(file, copy)):
                shutil.copy2(copy, file)

    def _changes(self) -> set[str]:
        changed = set()
        release = self.build("release")
        if any(self._differs(file) for file in (release / DLL, release / ABI_TABLES)):
            changed.add("module")
        if any(self._differs(file) for file in release.glob(CORE_OBJECTS)):
            changed.add("core")
        return changed

    def _differs(self, file: Path) -> bool:
        now, before = file.read_bytes(), self._kept(file).read_bytes()
        if file.suffix == ".obj":  # bytes 4 to 7 are the time
            now, before = now[:4] + now[8:], before[:4] + before[8:]
        return now != before

    def _test(self, changed: set[str], log: Path) -> Outcome:
        for number, stage in enumerate(self.stages):
            if stage.needs not in changed:
                continue
            self._build_for(stage, log)
            limit = 10 + 5 * self.seconds[str(number)]
            failed = self._run(stage, limit, log)
            if failed:
                return Outcome("killed", f"{stage.name}: {failed}")
        return Outcome("SURVIVED")

    def _run(self, stage: Stage, limit: float, log: Path) -> str:
        """What failed, empty when nothing did. The output goes to the end of the log."""
        # Without Wine's debugger, which a crash would wait for.
        environment = {**os.environ, **stage.environment, "WINEDLLOVERRIDES": "winedbg.exe=d"}
        command = ("timeout", "-k", "5", f"{limit:.0f}", *stage.command)
        with log.open("ab") as output:
            start = output.tell()
            status = subprocess.run(
                command,
                cwd=self.scratch,
                env=environment,
                stdin=subprocess.DEVNULL,
                stdout=output,
                stderr=output,
                preexec_fn=limit_files,
            ).returncode
        if not status:
            return ""
        return failure_of(status, log.read_bytes()[start:].decode(errors="replace"))

    def _clean_up(self) -> None:
        """What a test that was cut short has left in its folders."""
        users = Path(os.environ["WINEPREFIX"]) / "drive_c/users"
        for pattern in ("*/Temp/*", "*/AppData/Local/Temp/*", "*/AppData/Local/Programs/Tarn"):
            for left in users.glob(pattern):
                shutil.rmtree(left) if left.is_dir() else left.unlink()
        shutil.rmtree(self.scratch)
        self.scratch.mkdir()

    def _build_for(self, stage: Stage, log: Path | None = None) -> None:
        if stage.build:
            preset, target = stage.build
            self._ninja(preset, target, log=log)

    def _ninja(self, preset: str, *targets: str, log: Path | None = None) -> None:
        command = ("ninja", "-C", str(self.build(preset)), *targets)
        built = subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT)
        if log:
            with log.open("ab") as file:
                file.write(built.stdout)
        if built.returncode:
            raise BuildFailed(built.stdout.decode(errors="replace")[-4000:])


def _same_file(a: Path, b: Path) -> bool:
    x, y = a.stat(), b.stat()
    return (x.st_mtime_ns, x.st_size) == (y.st_mtime_ns, y.st_size)


def limit_files() -> None:
    resource.setrlimit(resource.RLIMIT_FSIZE, (LARGEST_FILE, LARGEST_FILE))
    resource.setrlimit(resource.RLIMIT_CORE, (0, 0))


def failure_of(status: int, output: str) -> str:
    failed = re.search(r"^\[  FAILED  \] ([\w/]+\.[\w/]+)", output, re.MULTILINE)
    if failed:
        return failed[1]
    running = re.findall(r"^\[ RUN      \] ([\w/]+\.[\w/]+)", output, re.MULTILINE)
    how = "timed out" if status in (124, 137) else f"ended with {status}"
    return f"{running[-1]} {how}" if running else how
