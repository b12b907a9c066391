#!/usr/bin/env python3
"""Runs clang-tidy over the sources of the product and fails on any finding.

Takes the build folder of the analysis preset, whose compile commands are clang's; nothing has to be built there.
With --locks clang alone reads the sources, for its warnings and the lock annotations; they may be in groups then.
"""
import argparse
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
    words = words[next(i for i, word in enumerate(words) if os.path.basename(word).startswith("clang++")):]
    if "-include-pch" in words:
        # A precompiled header that nobody has built is read as the header that it stands for.
        at = words.index("-include-pch")
        if not pathlib.Path(entry["directory"], words[at + 2]).exists():
            del words[at - 1:at + 3]
    return words


def changed_since(source, commit):
    told = subprocess.run(["git", "diff", "--name-only", commit], cwd=source, capture_output=True, text=True,
                          check=True)
    return {source / line for line in told.stdout.splitlines()}


def check_with_clang(entry):
    """Without code, and so without an object file."""
    words = entry["arguments"]
    if "-o" in words:
        at = words.index("-o")
        words = words[:at] + words[at + 2:]
    done = subprocess.run([*words, "-fsyntax-only"], cwd=entry["directory"], capture_output=True, text=True,
                          errors="replace", check=False)
    return entry["file"], done.returncode, done.stderr


def check_with_tidy(folder, entry):
    done = subprocess.run(["clang-tidy", "-p", folder, "--quiet", "--warnings-as-errors=*", entry["file"]],
                          capture_output=True, text=True, errors="replace", check=False)
    return entry["file"], done.returncode, done.stdout


def main() -> int:
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("build", type=pathlib.Path)
    parser.add_argument("parts", nargs="*", help="only sources whose path holds one of these")
    parser.add_argument("--locks", action="store_true", help="clang's own warnings only")
    parser.add_argument("--since", metavar="COMMIT", help="only sources that differ from this commit")
    options = parser.parse_args()
    build = options.build.resolve()
    source = pathlib.Path(__file__).resolve().parents[2]
    changed = changed_since(source, options.since) if options.since else None
    wanted = {}
    for entry in json.loads((build / "compile_commands.json").read_text()):
        path = pathlib.Path(entry["file"]).resolve()
        # The groups of sources lie in the folder of their target.
        root = build if options.locks and path.is_relative_to(build) else source
        if path.name == "mocs_compilation.cpp":
            continue  # what Qt's tool writes
        if not path.is_relative_to(root) or path.relative_to(root).parts[0] not in ROOTS:
            continue
        if options.parts and not any(part in str(path) for part in options.parts):
            continue
        if changed is not None and path not in changed:
            continue
        wanted[str(path)] = {"directory": entry["directory"], "file": str(path), "arguments": clean_command(entry)}
    name = "clang" if options.locks else "clang-tidy"
    if not wanted:
        print(f"{name}: no source to read" + (f" since {options.since}" if options.since else ""))
        return 0 if options.since else 1

    bad = 0
    with tempfile.TemporaryDirectory() as folder, concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        pathlib.Path(folder, "compile_commands.json").write_text(json.dumps(list(wanted.values())))

        def check(entry):
            return check_with_clang(entry) if options.locks else check_with_tidy(folder, entry)

        for _, code, output in pool.map(check, wanted.values()):
            if code != 0:
                bad += 1
                print(output, flush=True)
    print(f"{name}: {len(wanted)} files, {bad} with findings")
    return 1 if bad else 0


if __name__ == "__main__":
    sys.exit(main())
