#!/usr/bin/env python3
"""Checks the house rules that no compiler checks: who includes whom, and how long a file may be."""

import pathlib
import re
import sys

ROOT = pathlib.Path(__file__).resolve().parent.parent

PLUG_IN = {"core", "transfer", "coordination", "restore", "reporting"}
ALL = PLUG_IN | {"base", "platform", "device", "tools", "kit", "tests", "bench", "fuzz"}

# Room: the rooms whose headers it may include, its own among them.
MAY_INCLUDE = {
    "base": {"base"},
    "platform": {"base", "platform"},
    **{room: PLUG_IN | {"base", "platform"} for room in PLUG_IN},
    "device": {"base", "platform", "device"},
    "tools": {"base", "platform", "device", "tools"},
    "kit": {"base", "platform", "kit"},
    "tests": ALL,
    "bench": ALL,
    "fuzz": ALL,
}
# What the tool may include of the plug-in, which it loads: the files in which host and plug-in meet.
PUBLIC_HEADERS = {"core/SyncFiles.h"}

# Written by CMake, for tests: where things are on this machine.
GENERATED_HEADERS = {"generated/BuildPaths.h"}

STANDARD = re.compile(r"[a-z_0-9]+")
POSIX = r"(sys|linux)/[a-z0-9_]+\.h|(unistd|fcntl|signal|dirent|poll|termios|dlfcn|limits|locale|pthread)\.h"
# Room: the headers in angle brackets that it may include beside C++'s own. The others may include any.
THIRD_PARTY = {
    "base": r"(?!)",
    "platform": r"(?!)",
    **{room: r"(?!)" for room in PLUG_IN},
    "device": POSIX + r"|sqlite3\.h|archive(_entry)?\.h|cairo(/cairo)?[a-z-]*\.h",
    "tools": POSIX + r"|CLI/.*|nlohmann/.*",
}

LONGEST_FILE = 400
INCLUDE = re.compile(r"^\s*#\s*include\s*(?:<([^>]+)>|\"([^\"]+)\")")
COMMENT = re.compile(r"^\s*(//.*)?$")


def check_quoted(path: pathlib.Path, room: str, header: str) -> str | None:
    if header in GENERATED_HEADERS and room in {"tests", "bench"}:
        return None
    target = pathlib.PurePosixPath(header)
    other = target.parts[0]
    if other not in ALL or ".." in target.parts:
        return f'"{header}" does not begin with the room it lives in'
    if path.parent != ROOT and (path.parent / header).exists():
        return f'"{header}" is found beside this file before it is found in its room'
    if not (ROOT / header).exists():
        return f'"{header}" does not exist'
    if other in MAY_INCLUDE[room] or (room == "tools" and header in PUBLIC_HEADERS):
        return None
    return f'{room}/ may not include "{header}"'


def check_angled(room: str, header: str) -> str | None:
    if STANDARD.fullmatch(header) or room not in THIRD_PARTY or re.fullmatch(THIRD_PARTY[room], header):
        return None
    return f"{room}/ may not include <{header}>"


def check_include(path: pathlib.Path, room: str, line: str) -> str | None:
    match = INCLUDE.match(line)
    if not match:
        return None
    angled, quoted = match.groups()
    return check_quoted(path, room, quoted) if quoted else check_angled(room, angled)


def check_file(path: pathlib.Path, room: str) -> list[str]:
    where = path.relative_to(ROOT)
    lines = path.read_text(encoding="utf-8").splitlines()
    findings = []
    for number, line in enumerate(lines, 1):
        problem = check_include(path, room, line)
        if problem:
            findings.append(f"{where}:{number}: {problem}")
    if len(lines) > LONGEST_FILE:
        findings.append(f"{where}: {len(lines)} lines; a file has at most {LONGEST_FILE}")
    first_code = next((line for line in lines if not COMMENT.match(line)), "")
    if path.suffix == ".h" and first_code != "#pragma once":
        findings.append(f"{where}: a header's first line of code is #pragma once")
    return findings


def main() -> int:
    findings = []
    for room in sorted(ALL):
        for path in sorted((ROOT / room).rglob("*")):
            if path.suffix in {".h", ".cpp"}:
                findings += check_file(path, room)
    for finding in findings:
        print(finding, file=sys.stderr)
    return 1 if findings else 0


if __name__ == "__main__":
    sys.exit(main())
