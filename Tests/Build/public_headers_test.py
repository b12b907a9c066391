#!/usr/bin/env python3
"""Each installed header compiles alone, as C++17 and C++20, under hostile macros, and pulls in only Boost."""
import concurrent.futures
import os
import pathlib
import re
import subprocess
import sys
import tempfile

# What careless platform headers define; ours must not trip over it.
HOSTILE = "#define min(a, b) hostile\n#define max(a, b) hostile\n#define small hostile\n#define interface hostile\n" \
          "#define near hostile\n#define far hostile\n#define ERROR hostile\n#define IN hostile\n#define OUT hostile\n"
STANDARD = re.compile(r"^[a-z_0-9]+$")
STANDARD_FIRST = "".join(f"#include <{name}>\n" for name in (
    "algorithm", "atomic", "chrono", "condition_variable", "cstdint", "deque", "exception", "functional", "limits",
    "map", "memory", "mutex", "optional", "random", "set", "sstream", "string", "thread", "unordered_map", "vector"))


def public_headers(source):
    sys.path.insert(0, str(source / "Packaging"))
    from public_headers import list_public_headers  # the same list that the installation uses
    return list_public_headers(source)


def compile_text(source, text, standard):
    flags = ["-I", str(source / "API/Inc"), "-I", str(source / "Platform")]
    with tempfile.NamedTemporaryFile("w", suffix=".cpp") as file:
        file.write(text)
        file.flush()
        done = subprocess.run(["c++", f"-std={standard}", "-fsyntax-only", "-Wall", "-Wextra", "-Wpedantic",
                               "-Werror", *flags, file.name], capture_output=True, text=True, check=False)
    return done.stderr if done.returncode else ""


def check_alone(source, name):
    errors = compile_text(source, f'#include "{name}"\n', "c++17")
    return f"{name} alone as c++17:\n{errors}" if errors else ""


def check_all_under_hostile_macros(source, names):
    """One unit for all: the macros stay defined from the first header to the last."""
    # Neither Boost nor the standard library survives such macros, so what they give comes first, as a host has it.
    text = '#include "ostcore/Types.h"\n' + STANDARD_FIRST + HOSTILE
    errors = compile_text(source, text + "".join(f'#include "{name}"\n' for name in names), "c++20")
    return f"under hostile macros as c++20:\n{errors}" if errors else ""


def main():
    source = pathlib.Path(sys.argv[1]).resolve()
    headers = public_headers(source)
    failures = []
    for root, name in headers:
        for included in re.findall(r"#\s*include\s+<([^>]+)>", (root / name).read_text()):
            if not included.startswith("boost/") and not STANDARD.match(included):
                failures.append(f"{name} pulls in <{included}>")
    names = [name for _, name in headers]
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        hostile = pool.submit(check_all_under_hostile_macros, source, names)
        alone = pool.map(lambda name: check_alone(source, name), names)
        failures += [text for text in [*alone, hostile.result()] if text]
    print("\n".join(failures) or f"{len(headers)} public headers stand alone")
    return 1 if failures or len(headers) < 20 else 0


if __name__ == "__main__":
    sys.exit(main())
