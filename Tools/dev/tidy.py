#!/usr/bin/env python3
"""Runs clang-tidy over the sources of the product and fails on any finding.

Takes the build folder of the analysis preset: what clang compiled there, headers and all, clang-tidy can read.
"""
import concurrent.futures
import json
import os
import pathlib
import shlex
import subprocess
import sys
import tempfile

ROOTS = ("Platform", "Src", "Hub", "Tools", "Testing")


def clean_command(entry):
    """The compiler's words, without the launcher in front of them."""
    words = shlex.split(entry["command"]) if "command" in entry else list(entry["arguments"])
    return words[next(i for i, word in enumerate(words) if os.path.basename(word).startswith("clang++")):]


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
