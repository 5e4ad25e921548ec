#!/usr/bin/env python3
"""Checks which component includes which, against cmake/components.json. The build runs it before it compiles.

usage: components.py [--graph | --names | --plug-in]

A component is a directory. "above" names the components directly below it: it may include their headers, its own, and
those of all components further below. Of the system it may include C++'s headers and those that "system" lists ("posix"
for POSIX and Linux). Headers in its "private" directory are for itself, tests, benchmarks and fuzz targets.
Prints each offending include with the rule that it breaks, and exits with 1 if there is any.

--graph    prints what each component includes
--names    prints the top-level directories of all components
--plug-in  prints the plug-in's components and those that it is built on
"""

import fnmatch
import json
import pathlib
import re
import sys

ROOT = pathlib.Path(__file__).resolve().parent.parent
COMPONENTS = {each["name"]: each for each in json.loads((ROOT / "cmake/components.json").read_text())}
GENERATED_HEADERS = {"generated/BuildPaths.h"}  # written by CMake, for tests
POSIX = ["sys/*.h", "linux/*.h"] + [name + ".h" for name in (
    "unistd", "fcntl", "signal", "dirent", "poll", "termios", "dlfcn", "limits", "locale", "pthread", "stdlib")]
LONGEST_FILE = 400
INCLUDE = re.compile(r"^\s*#\s*include\s*(?:<([^>]+)>|\"([^\"]+)\")")
COMMENT = re.compile(r"^\s*(//.*)?$")


def component_of(path: str) -> str:
    """Returns the innermost component that holds `path`, or an empty string."""
    return max((name for name in COMPONENTS if path.startswith(name + "/")), key=len, default="")


def may_include_all(name: str) -> bool:
    return "*" in COMPONENTS[name]["above"]


def at_or_below(name: str) -> set[str]:
    if may_include_all(name):
        return set(COMPONENTS)
    return {name}.union(*(at_or_below(other) for other in COMPONENTS[name]["above"]))


def check_order() -> list[str]:
    """Requires the list to run from the lowest component to the highest, so that the graph cannot have a cycle."""
    findings, seen = [], {"*"}
    for name, component in COMPONENTS.items():
        findings += [f"cmake/components.json: {other}/ must be listed before {name}/, which is above it"
                     for other in component["above"] if other not in seen]
        seen.add(name)
    return findings


def check_quoted(name: str, allowed: set[str], header: str) -> str | None:
    if header in GENERATED_HEADERS and may_include_all(name):
        return None
    other = component_of(header)
    if not other or ".." in header:
        return f'"{header}" does not begin with the component of the header'
    if not (ROOT / header).is_file():
        return f'"{header}" does not exist'
    if other not in allowed:
        below = ", ".join(f"{each}/" for each in COMPONENTS[name]["above"]) or "the standard library"
        return f'"{header}" is in {other}/; {name}/ may include itself, {below} and what is below'
    private = COMPONENTS[other].get("private", "/")
    if header.startswith(private) and other != name and not may_include_all(name):
        return f'"{header}" is private to {other}/'
    return None


def check_angled(name: str, header: str) -> str | None:
    listed = COMPONENTS[name].get("system", [])
    patterns = [pattern for each in listed for pattern in (POSIX if each == "posix" else [each])]
    if re.fullmatch(r"[a-z_0-9]+", header) or any(fnmatch.fnmatchcase(header, pattern) for pattern in patterns):
        return None
    return f'<{header}> is not among the "system" headers of {name}/ in cmake/components.json'


def check_file(where: str, name: str, allowed: set[str], included: set[str]) -> list[str]:
    lines = (ROOT / where).read_text(encoding="utf-8").splitlines()
    findings = []
    for number, line in enumerate(lines, 1):
        match = INCLUDE.match(line) if "#" in line else None
        if not match:
            continue
        angled, quoted = match.groups()
        problem = check_quoted(name, allowed, quoted) if quoted else check_angled(name, angled)
        if problem:
            findings.append(f"{where}:{number}: {problem}")
        elif quoted:
            included.add(component_of(quoted))
    if len(lines) > LONGEST_FILE:
        findings.append(f"{where}: {len(lines)} lines; a file has at most {LONGEST_FILE}")
    first_code = next((line for line in lines if not COMMENT.match(line)), "")
    if where.endswith(".h") and first_code != "#pragma once":
        findings.append(f"{where}: the first line of code of a header is #pragma once")
    return findings


def directories() -> list[str]:
    return list(dict.fromkeys(name.partition("/")[0] for name in COMPONENTS))


def main() -> int:
    option = sys.argv[1] if len(sys.argv) > 1 else ""
    if option == "--names":
        print("\n".join(directories()))
        return 0
    if option == "--plug-in":
        print("\n".join(["base", "plist"] + [name for name, each in COMPONENTS.items() if each.get("plugIn")]))
        return 0
    findings = check_order()
    allowed = {name: at_or_below(name) for name in COMPONENTS}
    included: dict[str, set[str]] = {name: set() for name in COMPONENTS}
    for directory in directories():
        for path in sorted((ROOT / directory).rglob("*.*")):
            if path.suffix in {".h", ".cpp"}:
                where = str(path.relative_to(ROOT))
                name = component_of(where)
                findings += check_file(where, name, allowed[name], included[name])
    for finding in findings:
        print(finding, file=sys.stderr)
    if option == "--graph":
        for name, others in included.items():
            print(f"{name}: {' '.join(other for other in COMPONENTS if other in others - {name}) or '-'}")
    return 1 if findings else 0


if __name__ == "__main__":
    sys.exit(main())
