#!/usr/bin/env python3
"""Writes Docs/result-codes.md from the one table of result codes; with --check, compares instead."""
import pathlib
import re
import sys

ROW = re.compile(r'X\((\w+),\s*(0x[0-9A-F]{8})u,\s*"([^"]+)",\s*"([^"]+)"\)')


def render(source):
    text = (source / "API/Inc/ZOClient/ResultCodes.h").read_text()
    table = re.sub(r"\\\n", " ", text[text.index("#define ZOCL_RESULT_TABLE"):text.index("namespace ZOCL")])
    rows = ROW.findall(table)
    if len(rows) != table.count(" X("):
        raise SystemExit(f"read {len(rows)} of {table.count(' X(')} rows of the table")
    lines = ["# Result codes", "",
             "Made from the table in `API/Inc/ZOClient/ResultCodes.h` by `Tools/dev/result_codes.py`; a test keeps the",
             "two in step. A code with the top bit set is a failure. The name is what `zo` prints; names and codes stay.",
             "", "| Code | Name | Constant | Meaning |", "|---|---|---|---|"]
    lines += [f"| {code} | {name} | `{constant}` | {meaning} |" for constant, code, name, meaning in rows]
    return "\n".join(lines) + "\n"


def main():
    source = pathlib.Path(__file__).resolve().parents[2]
    page = source / "Docs/result-codes.md"
    text = render(source)
    if "--check" not in sys.argv[1:]:
        page.write_text(text)
        return 0
    if not page.exists() or page.read_text() != text:
        print("Docs/result-codes.md is not what the table says; run Tools/dev/result_codes.py")
        return 1
    print(f"{text.count(chr(10)) - 7} codes: page and table agree")
    return 0


if __name__ == "__main__":
    sys.exit(main())
