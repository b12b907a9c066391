#!/usr/bin/env python3
"""Writes a C++ source that holds files as bytes: embed_resources.py OUTPUT TYPE:FILE..."""
import pathlib
import sys

HEAD = """// Made from the files in Resources by cmake/embed_resources.py.
#include "ostcore/utility/BinaryResource.h"

namespace ZOCL {
namespace {

"""
# The extern declarations are also the prototypes: the constants would be internal without them.
TAIL = """}};

}}  // namespace

extern const ostcore::utility::BinaryModule kLibraryModule;
const ostcore::utility::BinaryModule kLibraryModule{{kEntries, {count}}};

}}  // namespace ZOCL
"""
BYTES_A_LINE = 24


def array(name, content):
    """A closing zero keeps the array of an empty file legal; it is not counted."""
    numbers = [str(byte) for byte in content] + ["0"]
    lines = [", ".join(numbers[at:at + BYTES_A_LINE]) for at in range(0, len(numbers), BYTES_A_LINE)]
    return f"constexpr unsigned char {name}[] = {{\n    " + ",\n    ".join(lines) + "};\n"


def main():
    output = pathlib.Path(sys.argv[1])
    arrays, entries, seen = [], [], set()
    for index, argument in enumerate(sys.argv[2:]):
        kind, path = argument.split(":", 1)
        name = pathlib.Path(path).stem
        if (kind, name) in seen:
            raise SystemExit(f"two resources of type {kind} are called {name}")
        seen.add((kind, name))
        content = pathlib.Path(path).read_bytes()
        arrays.append(array(f"kBytes{index}", content))
        entries.append(f'    {{"{kind}", "{name}", kBytes{index}, {len(content)}}},\n')
    if not entries:
        raise SystemExit("there are no resources")
    output.write_text(HEAD + "\n".join(arrays) + "\nconstexpr ostcore::utility::BinaryEntry kEntries[] = {\n" +
                      "".join(entries) + TAIL.format(count=len(entries)), encoding="ascii")


if __name__ == "__main__":
    main()
