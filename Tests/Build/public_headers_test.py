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


def check(source, header, standard, hostile):
    root, name = header
    flags = ["-I", str(source / "API/Inc"), "-I", str(source / "Platform")]
    # Neither Boost nor the standard library survives such macros, so what they give comes first, as a host has it.
    text = '#include "ostcore/Types.h"\n' + STANDARD_FIRST + HOSTILE if hostile else ""
    text += f'#include "{name}"\n'
    with tempfile.NamedTemporaryFile("w", suffix=".cpp") as file:
        file.write(text)
        file.flush()
        done = subprocess.run(["c++", f"-std={standard}", "-fsyntax-only", "-Wall", "-Wextra", "-Wpedantic",
                               "-Werror", *flags, file.name], capture_output=True, text=True, check=False)
    return f"{name} as {standard}{' under hostile macros' if hostile else ''}:\n{done.stderr}" if done.returncode else ""


def main():
    source = pathlib.Path(sys.argv[1]).resolve()
    headers = public_headers(source)
    failures = []
    for root, name in headers:
        for included in re.findall(r"#\s*include\s+<([^>]+)>", (root / name).read_text()):
            if not included.startswith("boost/") and not STANDARD.match(included):
                failures.append(f"{name} pulls in <{included}>")
    jobs = [(header, standard, hostile) for header in headers
            for standard, hostile in (("c++17", False), ("c++20", True))]
    with concurrent.futures.ThreadPoolExecutor(os.cpu_count()) as pool:
        failures += [text for text in pool.map(lambda job: check(source, *job), jobs) if text]
    print("\n".join(failures) or f"{len(headers)} public headers stand alone")
    return 1 if failures or len(headers) < 20 else 0


if __name__ == "__main__":
    sys.exit(main())
