#!/usr/bin/env python3
"""A floor can include itself and what lies below it, and nothing above: shown by the compiler.

The flags of each floor are taken from the compile database. For each ordered pair of floors a source with
one include is read; that must go well exactly when the included floor is not above. The second half of
the pairs is the control: were the harness broken, they would fail.
"""
import json
import os
import pathlib
import re
import subprocess
import sys
import tempfile


def floors_in_order(source):
    text = (source / "CMakeLists.txt").read_text()
    declared = re.search(r"zo_declare_floors\(([^)]*)\)", text).group(1).split()
    return [floor for floor in declared if list((source / "Src" / floor).glob("*.cpp"))]


def include_flags(database, source, floor):
    for entry in database:
        if f"/floor_{floor}.dir/" in entry.get("output", entry["command"]):
            words = entry["command"].split()
            return [word for word in words if word.startswith(("-I", "-std=", "-D"))] + \
                [flag for index, word in enumerate(words) if word == "-isystem" for flag in (word, words[index + 1])]
    raise SystemExit(f"no compile command for floor {floor}")


def compiles(flags, text):
    """Whether the compiler finds all that the text includes; the rest of its work says nothing about floors."""
    with tempfile.NamedTemporaryFile("w", suffix=".cpp") as file:
        file.write(text)
        file.flush()
        done = subprocess.run(["c++", "-E", "-o", os.devnull, *flags, file.name], capture_output=True, text=True, check=False)
        return done.returncode == 0, done.stderr


def main():
    source, build = (pathlib.Path(argument).resolve() for argument in sys.argv[1:3])
    database = json.loads((build / "compile_commands.json").read_text())
    order = floors_in_order(source)
    failures, pairs = [], 0
    for index, floor in enumerate(order):
        flags = include_flags(database, source, floor)
        for other_index, other in enumerate(order):
            headers = sorted((source / "Src" / other).glob("*.h"))
            if not headers:
                continue  # all that the floor shows is public
            header = headers[0].name
            good, errors = compiles(flags, f'#include "{other}/{header}"\n')
            pairs += 1
            if other_index > index and good:
                failures.append(f"{floor} may include {other}/{header}, which is above it")
            if other_index > index and not good and "No such file" not in errors:
                failures.append(f"{floor} -> {other} failed for another reason:\n{errors}")
            if other_index <= index and not good:
                failures.append(f"{floor} cannot include {other}/{header} below it:\n{errors}")
    for path in [*(source / "Src").rglob("*.[hc]*"), *(source / "Platform").rglob("*.[hc]*"),
                 *(source / "Inc").rglob("*.h")]:
        for line in path.read_text().splitlines():
            if re.match(r'\s*#\s*include\s+"\.\./', line):
                failures.append(f"{path.relative_to(source)} climbs out of its folder: {line.strip()}")
    hub = re.compile(r'#\s*include\s+[<"](ZOClient|ostcore|ostnet|RFL|zourl|HLM|ostmediatypes|ostnetsync|ostui)/')
    for path in (source / "Hub").rglob("*.[hc]*"):
        if hub.search(path.read_text()):
            failures.append(f"{path.relative_to(source)} shares code with the client")
    print("\n".join(failures) or f"{len(order)} floors, {pairs} pairs: each includes what it may and no more")
    return 1 if failures or len(order) < 8 else 0


if __name__ == "__main__":
    sys.exit(main())
