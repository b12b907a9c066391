#!/usr/bin/env python3
"""Runs the benchmarks of a release build and counts which targets hold.

Each benchmark prints lines of the form
  bench NAME: ours X unit, baseline Y unit (WHAT), ratio R, target T: holds
or, for a figure that later work is to be compared with,
  bench NAME: FIGURES, recorded
This runner passes them on and ends with a count. With names, only the programs bench_NAME run.
"""
import pathlib
import re
import subprocess
import sys

LINE = re.compile(r"^bench [\w-]+: ours .* ratio [\d.]+, target .*: (holds|falls short)$")
RECORD = re.compile(r"^bench [\w-]+: \d.*, recorded$")


def main() -> int:
    build = pathlib.Path(sys.argv[1])
    wanted = [name.replace("-", "_") for name in sys.argv[2:]]
    programs = sorted(build.rglob("bench_*"))
    programs = [p for p in programs if p.is_file() and p.stat().st_mode & 0o100 and not p.suffix]
    if wanted:
        programs = [p for p in programs if p.name[len("bench_"):] in wanted]
    if not programs:
        print("bench: no such benchmark" if wanted else "bench: nothing was built", file=sys.stderr)
        return 2
    held, short, recorded, failed = 0, 0, 0, 0
    for program in programs:
        done = subprocess.run([str(program)], stdout=subprocess.PIPE, text=True, check=False)
        lines = [line for line in done.stdout.splitlines() if line.startswith("bench ")]
        for line in lines:
            print(line, flush=True)
            match = LINE.match(line)
            if RECORD.match(line):
                recorded += 1
            elif not match:
                print(f"bench: {program.name} printed a line of another form", file=sys.stderr)
                failed += 1
            elif match.group(1) == "holds":
                held += 1
            else:
                short += 1
        if done.returncode != 0 or not lines:
            print(f"bench: {program.name} failed with exit code {done.returncode}", file=sys.stderr)
            failed += 1
    print(f"bench: {held} hold, {short} fall short, {recorded} recorded, {failed} failed")
    return 1 if failed else 0


if __name__ == "__main__":
    sys.exit(main())
