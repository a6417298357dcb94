# SPDX-License-Identifier: MIT
# includes.py SOURCE_FOLDER: a file includes only files of its folder and of lower layers.
# Prints each include that breaks this, with its file and line.
import re
import sys
from pathlib import Path

CORE = ["Core/cLib", "Core/iLib", "Core/xLib"]
# Each list is a stack of layers, the lowest first. A folder's subfolders belong to its layer.
STACKS = [
    CORE + ["Scripting/scriptruby"],
    ["Scripting/rubyscript"],
    CORE
    + ["Tools/macrorun/" + layer
       for layer in ["platform", "document", "functions", "report", "host", "recording", "cli"]],
]
# Include paths start at the file's folder or at one of these.
INCLUDE_FOLDERS = ["Core", "Scripting/rubyscript", "Tools/macrorun"]
SOURCES = {".h", ".cpp", ".c"}


def layers_below(folder):
    """The layer of a folder, and the layers that it may include."""
    for stack in STACKS:
        for index, layer in enumerate(stack):
            if folder == layer or folder.startswith(layer + "/"):
                return layer, stack[: index + 1]
    return None, []


def included_file(root, file, name):
    for folder in [file.parent] + [root / folder for folder in INCLUDE_FOLDERS]:
        if (folder / name).exists():
            return (folder / name).resolve().relative_to(root)
    return None


def check(root, file):
    problems = []
    layer, allowed = layers_below(file.parent.relative_to(root).as_posix())
    for number, line in enumerate(file.read_text(encoding="utf-8").splitlines(), 1):
        include = re.match(r'\s*#\s*include\s*"([^"]+)"', line)
        if not include:
            continue
        target = included_file(root, file, include[1])
        if not target:
            problem = "no such file in the source tree"
        elif not any(target.as_posix().startswith(folder + "/") for folder in allowed):
            problem = f"{layer or 'a folder without a layer'} may not include {target.parent}"
        else:
            continue
        problems.append(f"{file.relative_to(root)}:{number}: {include[1]}: {problem}")
    return problems


root = Path(sys.argv[1]).resolve()
files = [file for part in ["Core", "Scripting", "Tools/macrorun"]
         for file in sorted((root / part).rglob("*")) if file.suffix in SOURCES]
problems = [problem for file in files for problem in check(root, file)]
print("\n".join(problems) or f"{len(files)} files, no include upwards")
sys.exit(1 if problems or not files else 0)
