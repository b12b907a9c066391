#!/usr/bin/env python3
"""Runs clang-tidy over the sources of the product, two at a time, and fails on any finding."""
import concurrent.futures
import json
import os
import pathlib
import subprocess
import sys
import tempfile

ROOTS = ("Platform", "Src", "Hub", "Tools", "Testing")
# Flags that only gcc knows, or that would ask clang for gcc's precompiled headers.
DROPPED = ("-fpch-preprocess", "-Winvalid-pch")


def clean_command(entry):
    words = entry["command"].split() if "command" in entry else list(entry["arguments"])
    out, skip = [], False
    for position, word in enumerate(words):
        if skip:
            skip = False
            continue
        if word == "-include" and position + 1 < len(words) and "cmake_pch" in words[position + 1]:
            skip = True
            continue
        if word in DROPPED or word.endswith("ccache") or "=" in word and word.startswith("CCACHE_"):
            continue
        out.append(word)
    start = next(i for i, word in enumerate(out) if os.path.basename(word).startswith(("c++", "g++", "clang++")))
    return out[start:]


def main() -> int:
    build = pathlib.Path(sys.argv[1])
    source = pathlib.Path(__file__).resolve().parents[2]
    database = json.loads((build / "compile_commands.json").read_text())
    wanted = {}
    for entry in database:
        path = pathlib.Path(entry["file"])
        try:
            relative = path.resolve().relative_to(source)
        except ValueError:
            continue
        if relative.parts[0] in ROOTS:
            wanted[str(path)] = {"directory": entry["directory"], "file": str(path),
                                 "arguments": clean_command(entry)}
    if sys.argv[2:]:
        wanted = {path: entry for path, entry in wanted.items() if any(part in path for part in sys.argv[2:])}
    with tempfile.TemporaryDirectory() as folder:
        pathlib.Path(folder, "compile_commands.json").write_text(json.dumps(list(wanted.values())))

        def check(path):
            done = subprocess.run(["clang-tidy", "-p", folder, "--quiet", "--warnings-as-errors=*", path],
                                  capture_output=True, text=True, check=False)
            return path, done.returncode, done.stdout

        bad = 0
        with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
            for path, code, output in pool.map(check, sorted(wanted)):
                if code != 0:
                    bad += 1
                    print(output, flush=True)
        print(f"clang-tidy: {len(wanted)} files, {bad} with findings")
        return 1 if bad or not wanted else 0


if __name__ == "__main__":
    sys.exit(main())
