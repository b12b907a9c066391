#!/usr/bin/env python3
"""Runs the tests of the request chain again and again and stops at the first failure.

soak.py BUILD COUNT [PROGRAM...]: so many rounds of all programs below, or of those that are named, as many at a
time as there are processors. The output of a run that fails is printed whole. Interrupted, it says how far it came.
"""
import concurrent.futures
import os
import pathlib
import signal
import subprocess
import sys
import tempfile
import time

# The layers, each for itself and all together, over a scripted network and over sockets.
PROGRAMS = {
    "test_request_chain": "*",
    "test_request_chain_hub": "*",
    "test_ostnet": "Caching*.*:Deflating*.*:ExpiringEntryMap*.*:Cancel.*:Shutdown.*:PostFunction.*:Workers.*",
    "test_connection": "Authorization*.*",
    "test_faults": "Renewal.*:Cancels.*",
}
LONGEST_RUN_SECONDS = 1200
SUPPRESSIONS = pathlib.Path(__file__).resolve().parents[2] / "Tests" / "tsan.supp"


def run(program, tests, home):
    """None when all passed, else what the program said."""
    environment = dict(os.environ, TMPDIR=home)
    for kind in ("STATE", "CONFIG", "CACHE"):
        environment[f"ZOCLIENT_{kind}_HOME"] = os.path.join(home, kind.lower())
    environment.setdefault("TSAN_OPTIONS", f"halt_on_error=1 suppressions={SUPPRESSIONS}")
    try:
        done = subprocess.run([program, f"--gtest_filter={tests}"], env=environment, timeout=LONGEST_RUN_SECONDS,
                              stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True, errors="replace",
                              check=False)
    except subprocess.TimeoutExpired as late:
        return f"{late.output or ''}\nno end within {LONGEST_RUN_SECONDS} s"
    ran_none = "[==========] Running 0 tests" in done.stdout
    return None if done.returncode == 0 and not ran_none else f"{done.stdout}\nexit code {done.returncode}"


def timed_run(build, name):
    begun = time.monotonic()
    with tempfile.TemporaryDirectory(prefix="zo-soak-") as home:
        failure = run(build / "tests" / name, PROGRAMS[name], home)
    return failure, time.monotonic() - begun


def report(runs, started):
    for name, (count, seconds) in runs.items():
        print(f"{name}: {count} runs without a failure, {seconds / max(count, 1):.1f} s each")
    print(f"{time.monotonic() - started:.0f} s in all", flush=True)


def main() -> int:
    build, count = pathlib.Path(sys.argv[1]).resolve(), int(sys.argv[2])
    names = sys.argv[3:] or list(PROGRAMS)
    runs = {name: (0, 0.0) for name in names}
    signal.signal(signal.SIGTERM, signal.default_int_handler)
    started = shown = time.monotonic()
    # As many at a time as there are processors: most of them wait now and then.
    pool = concurrent.futures.ThreadPoolExecutor(os.cpu_count() or 1)
    try:
        for round_ in range(1, count + 1):
            failed = False
            for name, (failure, seconds) in zip(names, pool.map(lambda name: timed_run(build, name), names)):
                if failure is not None:
                    print(f"{failure}\n{name} failed in round {round_}")
                    failed = True
                    continue
                runs[name] = (runs[name][0] + 1, runs[name][1] + seconds)
            if failed:
                report(runs, started)
                return 1
            if time.monotonic() - shown > 60:
                shown = time.monotonic()
                print(f"round {round_} of {count}", flush=True)
    except KeyboardInterrupt:
        for again in (signal.SIGINT, signal.SIGTERM):
            signal.signal(again, signal.SIG_IGN)
        print("interrupted")
        report(runs, started)
        return 130
    report(runs, started)
    return 0


if __name__ == "__main__":
    sys.exit(main())
