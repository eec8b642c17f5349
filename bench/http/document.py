"""Where results go: below build/, and into docs/performance.md when that is asked for."""

import datetime
import os
import pathlib
import platform
import re

PROJECT = pathlib.Path(__file__).resolve().parents[2]
DOCUMENT = PROJECT / "docs/performance.md"


def machine():
    """One line about what has measured, and when."""
    model = platform.processor() or platform.machine()
    for line in pathlib.Path("/proc/cpuinfo").read_text().splitlines():
        if line.startswith("model name"):
            model = line.partition(":")[2].strip()
            break
    memory = os.sysconf("SC_PAGE_SIZE") * os.sysconf("SC_PHYS_PAGES") / 2 ** 30
    day = datetime.date.today().isoformat()
    return (f"{day}, {model}, {len(os.sched_getaffinity(0))} processors, {memory:.0f} GiB, "
            f"Linux {platform.release().partition('-')[0]}")


def load_warning():
    """What to say when others use the machine; "" when it is idle."""
    load = os.getloadavg()[0]
    if load < 0.5:
        return ""
    return f"The load was {load:.1f} before this run began: others used the machine too."


def replace_between(text, name, content):
    """The text with the part between the markers of a name replaced."""
    begin, end = f"<!-- {name} -->", f"<!-- end of {name} -->"
    pattern = re.compile(re.escape(begin) + r".*?" + re.escape(end), re.S)
    if len(pattern.findall(text)) != 1:
        raise SystemExit(f"{DOCUMENT.name} has not one place that is marked {begin}")
    return pattern.sub(lambda _: f"{begin}\n{content}\n{end}", text)


def publish(name, content, pictures, results, in_document):
    """Writes `name`.md and the pictures (file name to SVG) into the folder of results,
    and into docs/ when that is asked for."""
    results.mkdir(parents=True, exist_ok=True)
    (results / f"{name}.md").write_text(content + "\n")
    for file, picture in pictures.items():
        (results / file).write_text(picture)
    print(f"\nwritten to {os.path.relpath(results)}")
    if in_document:
        text = replace_between(DOCUMENT.read_text(), name, content)
        for file, picture in pictures.items():
            (DOCUMENT.parent / file).write_text(picture)
        DOCUMENT.write_text(text)
        print(f"and to {os.path.relpath(DOCUMENT)}")
