"""The page for authors shows the example that is built: block for block."""

import pathlib
import re
import sys


def main():
    page = pathlib.Path(sys.argv[1]).read_text(encoding="utf-8")
    folder = pathlib.Path(sys.argv[2])
    files = {path.name: path.read_text(encoding="utf-8") for path in folder.iterdir()}
    blocks = re.findall(r"^```(cpp|json|cmake)\n(.*?)^```$", page, re.MULTILINE | re.DOTALL)
    expected = {"cpp": "Light.cpp", "json": "Acme.Light.lib", "cmake": "CMakeLists.txt"}
    missing = [text for kind, text in blocks if text not in files[expected[kind]]]
    shown = {kind for kind, _ in blocks}
    if shown != set(expected):
        sys.exit(f"the page shows {sorted(shown)}")
    if missing:
        sys.exit("not in the example:\n" + "\n".join(missing))


main()
