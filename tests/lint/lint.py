# SPDX-License-Identifier: Apache-2.0
"""Reads the #include lines of the sources and the calls in the tests, and tells what breaks the rules.

lint.py ROOT QT_FOLDER...: ROOT is the source folder; the headers of QT_FOLDER (Qt Gui, Qt Widgets...)
are those that the core does without. Ends with 1 and a line for each fault.
"""
import re
import sys
from pathlib import Path

INCLUDE = re.compile(r'^\s*#\s*include\s*([<"])([^">]+)[">]')
GENERATED = re.compile(r"(ui_\w+\.h|\w+\.moc|vxi11\.h)$")
# What lets a fixed time pass instead of waiting for a condition.
SLEEP = re.compile(r"\b(qWait|qSleep|[mu]?sleep|nanosleep|sleep_for|sleep_until)\s*\(|\bpoll\(nullptr")
# The one file of a plain folder that the workbench knows: it loads the library at run time.
LOADED_LIBRARY = Path("visa/visa.h")


def read_table(root):
    """Folder -> (place, ring), as in cmake/folders.txt."""
    lines = (root / "cmake/folders.txt").read_text().splitlines()
    rows = [line.split() for line in lines if line and not line.startswith("#")]
    return {row[0]: (place, row[1]) for place, row in enumerate(rows)}


def folder_of(table, path):
    """The innermost folder of the table that the path lies in, or None."""
    for parent in path.parents:
        if parent.as_posix() in table:
            return parent.as_posix()
    return None


def sources(root, folder):
    for path in sorted((root / folder).rglob("*")):
        if path.suffix in (".cpp", ".h", ".c") and path.is_file():
            yield path.relative_to(root)


def resolve(root, path, name):
    """The file of the project that a quoted include means, or None."""
    for base in (path.parent, Path("src"), Path(".")):
        if (root / base / name).is_file():
            return Path((root / base / name).resolve().relative_to(root.resolve()))
    return None


def include_fault(root, table, window_headers, path, bracket, name):
    """Why the file may not include that, or None."""
    folder = folder_of(table, path)
    if folder is None:
        return f"lies in no folder of cmake/folders.txt and includes {name}"
    place, ring = table[folder]
    if bracket == "<":
        head = name.split("/")[0]
        if ring != "window" and (head in window_headers or Path(name).name in window_headers):
            return f"includes <{name}>: {folder} does without windows"
        if ring == "plain" and re.match(r"Q[A-Zt]", head):
            return f"includes <{name}>: {folder} does without Qt"
        return None
    target = resolve(root, path, name)
    if target is None:
        return None if GENERATED.match(Path(name).name) else f'includes "{name}", which is not there'
    to = folder_of(table, target)
    if to is None:
        return f"includes {target}, which lies in no folder of cmake/folders.txt"
    if table[to][0] > place:
        return f"includes {target} upward, from {folder}"
    if to != folder and to != "protocols" and target != LOADED_LIBRARY and "plain" in (ring, table[to][1]):
        return f"includes {target}: {folder} and {to} know nothing of each other"
    return None


def lint(root, qt_folders):
    table = read_table(root)
    window_headers = {Path(folder).name for folder in qt_folders}
    window_headers.update(f.name for folder in qt_folders for f in Path(folder).iterdir() if f.is_file())
    faults = []
    count = 0
    for top in sorted({folder.split("/")[0] for folder in table}):
        for path in sources(root, top):
            count += 1
            for number, line in enumerate((root / path).read_text().splitlines(), 1):
                match = INCLUDE.match(line)
                fault = match and include_fault(root, table, window_headers, path, *match.groups())
                if fault:
                    faults.append(f"{path}:{number}: {fault}")
    for path in sources(root, "tests"):
        for number, line in enumerate((root / path).read_text().splitlines(), 1):
            match = SLEEP.search(line.split("//")[0])
            if match:
                faults.append(f"{path}:{number}: sleeps by {match.group(0)}; wait for a condition")
    return faults, count


if __name__ == "__main__":
    found, read = lint(Path(sys.argv[1]), sys.argv[2:])
    print(*found, sep="\n", end="\n" if found else "")
    print(f"{read} sources read, {len(found)} faults")
    sys.exit(1 if found or read == 0 else 0)
