#!/usr/bin/env python3
"""A host outside the tree builds against the installation, by CMake and by pkg-config, and runs.

The host connects, without a hub, to the scripted one of the testing library and prints what it found.
"""
import os
import pathlib
import shutil
import subprocess
import sys
import tempfile

EXPECTED = "signed in as ada; productions: Harbour Film"


def run(*words, **more):
    done = subprocess.run(words, capture_output=True, text=True, check=False, **more)
    if done.returncode != 0:
        print(f"failed: {' '.join(map(str, words))}\n{done.stdout}\n{done.stderr}")
        sys.exit(1)
    return done.stdout


def main():
    source, build = (pathlib.Path(argument).resolve() for argument in sys.argv[1:3])
    with tempfile.TemporaryDirectory() as folder:
        work = pathlib.Path(folder)
        prefix = work / "prefix"
        run("cmake", "--install", build, "--prefix", prefix)
        shutil.copytree(source / "Examples/host", work / "host")
        library_folders = sorted({str(path.parent) for path in prefix.rglob("libZOClient.so")})
        if len(library_folders) != 1:
            print(f"libZOClient.so is installed in {library_folders}")
            return 1
        environment = dict(os.environ, LD_LIBRARY_PATH=library_folders[0],
                           PKG_CONFIG_PATH=library_folders[0] + "/pkgconfig",
                           ZOCLIENT_CONFIG_HOME=str(work / "config"), ZOCLIENT_STATE_HOME=str(work / "state"),
                           ZOCLIENT_CACHE_HOME=str(work / "cache"))
        sanitize = [line.split("=", 1)[1] for line in (build / "CMakeCache.txt").read_text().splitlines()
                    if line.startswith("ZO_SANITIZE:")][0]
        extra = [f"-fsanitize={sanitize}"] if sanitize else []

        run("cmake", "-S", work / "host", "-B", work / "host-build", "-G", "Ninja", f"-DCMAKE_PREFIX_PATH={prefix}",
            "-DCMAKE_CXX_FLAGS=" + " ".join(extra))
        run("cmake", "--build", work / "host-build")
        outputs = [run(work / "host-build/example_host", env=environment)]

        flags = run("pkg-config", "--cflags", "--libs", "zoclient-testing", env=environment).split()
        run("c++", "-std=c++17", *extra, work / "host/main.cpp", "-o", work / "host-pc", *flags)
        outputs.append(run(work / "host-pc", env=environment))
        for output in outputs:
            if EXPECTED not in output:
                print(f"the host printed:\n{output}")
                return 1
        # An install tree that names the build or source tree does not survive a move.
        for path in [*prefix.rglob("*.cmake"), *prefix.rglob("*.pc")]:
            if str(build) in path.read_text() or str(source) in path.read_text():
                print(f"{path.relative_to(prefix)} names the build tree")
                return 1
    print("the installation serves hosts by find_package and by pkg-config")
    return 0


if __name__ == "__main__":
    sys.exit(main())
