#!/usr/bin/env python3
"""The headers that are installed: API/Inc whole, and of Platform what is not in a folder named detail."""
import pathlib
import sys


def list_public_headers(source):
    """Pairs of root folder and path below it, sorted."""
    found = []
    for root in (source / "API/Inc", source / "Platform"):
        for path in root.rglob("*.h"):
            relative = path.relative_to(root)
            if "detail" not in relative.parts:
                found.append((root, str(relative)))
    return sorted(found, key=lambda pair: pair[1])


if __name__ == "__main__":
    for header_root, header_name in list_public_headers(pathlib.Path(sys.argv[1]).resolve()):
        print(header_root / header_name)
