"""A folder includes only from floors below its own, as ARCHITECTURE.md shows."""

import pathlib
import re
import sys

INCLUDE = re.compile(r'^\s*#\s*include\s+"([^"]+)"', re.MULTILINE)
ROW = re.compile(r"^\| (\d|–) \| (.+?) \| .* \| (.+?) \|$", re.MULTILINE)


def read_floors(page):
    """Folder to (floor, folders it may include from), out of the table."""
    floors = {}
    for floor, folders, below in ROW.findall(page):
        for folder in re.findall(r"`([^`]+)/`", folders):
            floors[folder] = (floor, below)
    return floors


def folder_of(path, floors):
    """The longest folder of the table that holds the path."""
    names = [name for name in floors if path == name or path.startswith(name + "/")]
    return max(names, key=len) if names else None


def resolve(including, name, root):
    """The path of an included file from the root of the tree; None outside of it."""
    if name.startswith("webapi/"):
        return "include/" + name
    if name == "platform/Paths.h":
        return name
    if (root / name).is_file():
        return name
    beside = including.parent / name
    return str(beside.relative_to(root)) if beside.is_file() else None


def allowed(source, target, floors):
    if source == target:
        return True
    number, below = floors[source]
    if below == "all":
        return True
    target_number = floors[target][0]
    if number in "012345" and number != "–":
        return target_number != "–" and target_number < number
    return f"`{target}/`" in below


def main():
    root = pathlib.Path(sys.argv[1])
    floors = read_floors((root / "ARCHITECTURE.md").read_text(encoding="utf-8"))
    required = {"platform", "include/webapi", "src/base", "src/entry", "hosts/linux", "apis"}
    if not required <= set(floors):
        sys.exit(f"the table lacks {sorted(required - set(floors))}")
    problems = []
    seen = 0
    for folder in ("platform", "include", "src", "hosts", "apis", "programs"):
        for path in sorted((root / folder).rglob("*")):
            if path.suffix not in (".h", ".cpp"):
                continue
            source = folder_of(str(path.relative_to(root)), floors)
            for name in INCLUDE.findall(path.read_text(encoding="utf-8")):
                resolved = resolve(path, name, root)
                target = folder_of(resolved, floors) if resolved else None
                seen += 1
                if source is None or target is None or not allowed(source, target, floors):
                    problems.append(f"{path.relative_to(root)} includes {name}")
    if seen < 100:
        sys.exit(f"only {seen} includes found")
    if problems:
        sys.exit("\n".join(problems))


main()
