"""Tables and listings of what the coverage build's tests have reached: scripts/coverage runs it.

    coverage_report.py BUILD_FOLDER

Each part of the code is read from the binary that ships it, so that what only a test program holds does not count.
"""

import json
import pathlib
import subprocess
import sys

SOURCE = pathlib.Path(__file__).resolve().parent.parent
BUILD = pathlib.Path(sys.argv[1])
PROFILE = BUILD / "all.profdata"
REPORT = BUILD / "report"

# Name, binary, rooms.
PARTS = [
    ("module", "lib/libnorvane_fc_provider.so",
     ["runtime", "cmpi", "classes", "foundation", "inventory", "agent", "services", "diagnostics", "logs"]),
    ("host", "host/nvrcim", ["host"]),
    ("simulator", "simulator/lib/libnvrsim_core.so", ["simulator"]),
    ("MOF tools", "generator/norvane_generator", ["mof", "generator"]),
]
LEAST = {"lines": 95.0, "branches": 85.0}  # percent, of the module


def llvm_cov(command, binary, *options):
    return subprocess.run(["llvm-cov", command, f"-instr-profile={PROFILE}", *options, str(BUILD / binary)], check=True,
                          capture_output=True, text=True).stdout


def room_of(file):
    """The room of a source of ours, or None for a generated or a system's file."""
    path = pathlib.Path(file).resolve()
    if BUILD.parent in path.parents or SOURCE not in path.parents:
        return None
    return path.relative_to(SOURCE).parts[0]


class Count:
    def __init__(self):
        self.count = self.covered = 0

    def add(self, summary):
        self.count += summary["count"]
        self.covered += summary["covered"]

    def percent(self):
        return 100.0 * self.covered / self.count if self.count else 100.0

    def __str__(self):
        return f"{self.covered:6} of {self.count:6} {self.percent():6.2f} %"


def measured(binary, rooms):
    """(file, lines, branches) of each source of these rooms."""
    for entry in json.loads(llvm_cov("export", binary, "-summary-only"))["data"][0]["files"]:
        if room_of(entry["filename"]) not in rooms:
            continue
        lines, branches = Count(), Count()
        lines.add(entry["summary"]["lines"])
        branches.add(entry["summary"]["branches"])
        yield str(pathlib.Path(entry["filename"]).resolve().relative_to(SOURCE)), lines, branches


def missed(binary, rooms):
    """File to the numbers of its lines that nothing reached, and to those with a branch that was not taken."""
    found, file = {}, None
    for record in llvm_cov("export", binary, "-format=lcov").splitlines():
        kind, _, rest = record.partition(":")
        if kind == "SF":
            wanted = room_of(rest) in rooms
            file = str(pathlib.Path(rest).resolve().relative_to(SOURCE)) if wanted else None
        elif file and kind == "DA":
            line, count = rest.split(",")[:2]
            if count == "0":
                found.setdefault(file, (set(), set()))[0].add(int(line))
        elif file and kind == "BRDA":
            line, _, _, taken = rest.split(",")
            if taken in ("0", "-"):
                found.setdefault(file, (set(), set()))[1].add(int(line))
    return found


def ranges(numbers):
    """"1-3, 7"."""
    texts, run = [], []
    for number in [*sorted(numbers), None]:
        if run and (number is None or number != run[-1] + 1):
            texts.append(str(run[0]) if len(run) == 1 else f"{run[0]}-{run[-1]}")
            run = []
        run.append(number)
    return ", ".join(texts)


def write_missed(out, name, found):
    out.write(f"== {name}\n")
    for file in sorted(found):
        lines, branches = found[file]
        text = SOURCE.joinpath(file).read_text(encoding="utf-8").splitlines()
        out.write(f"\n{file}: lines {ranges(lines) or '-'}; branches in {ranges(branches - lines) or '-'}\n")
        for number in sorted(lines | branches):
            out.write(f"{number:6} {'line  ' if number in lines else 'branch'} {text[number - 1]}\n")
    out.write("\n")


def main():
    REPORT.mkdir(exist_ok=True)
    good = True
    with open(REPORT / "summary.txt", "w", encoding="utf-8") as summary, \
            open(REPORT / "not_covered.txt", "w", encoding="utf-8") as listing:
        for name, binary, rooms in PARTS:
            files = list(measured(binary, rooms))
            total = {"lines": Count(), "branches": Count()}
            by_room = {room: (Count(), Count()) for room in rooms}
            for file, lines, branches in files:
                for all_of, one in ((total["lines"], lines), (total["branches"], branches)):
                    all_of.add(vars(one))
                for all_of, one in zip(by_room[file.split("/")[0]], (lines, branches)):
                    all_of.add(vars(one))
            print(f"{name:14} lines {total['lines']}   branches {total['branches']}")
            if len(rooms) > 1:
                for room, (lines, branches) in by_room.items():
                    print(f"  {room:12}       {lines}            {branches}")
            if name == "module":
                for kind, least in LEAST.items():
                    if total[kind].percent() < least:
                        print(f"  less than {least} % of the {kind}")
                        good = False
            summary.write(f"== {name}\n")
            for file, lines, branches in sorted(files, key=lambda row: row[1].covered - row[1].count):
                summary.write(f"{file:50} lines {lines}   branches {branches}\n")
            summary.write("\n")
            write_missed(listing, name, missed(binary, rooms))
    module = PARTS[0]
    llvm_cov("show", module[1], "-format=html", f"-output-dir={REPORT / 'html'}", "-show-branches=count",
             f"-ignore-filename-regex={BUILD.parent}/|/usr/")
    print(f"\n{REPORT}/summary.txt: each file; not_covered.txt: each line and branch; html/index.html: the sources")
    return 0 if good else 1


if __name__ == "__main__":
    sys.exit(main())
