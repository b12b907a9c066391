#!/usr/bin/env python3
"""The edge of the shared libraries: what is exported is ours, and what is internal stays inside."""
import re
import subprocess
import sys

OURS = {
    0: re.compile(r"\bZOCL::"),
    1: re.compile(r"\b(ostcore|ostnet|RFL|zourl|HLM|ostmarshal|ostmediatypes|ostui|ostlyra|ostnetsync|QM|OrvaneXMP\w*)::"),
}
# Strong symbols that must be visible, or nothing works; they show that the test reads what it believes.
WANTED = {
    0: ["ZOCL::Initialize()", "ZOCL::GetResultFromResponse("],
    1: ["ostcore::utility::ImmutableString::ImmutableString(", "ostnet::http::GetGlobalRequestProcessor()"],
}
INTERNAL = re.compile(r"\b(simdjson|sqlite3_|curl_|libdeflate_|spdlog)|ZOCL::(DataServer|ServerResource|Production|"
                      r"AuthorizationProcessor|ConnectSequence)\b")


def main():
    failures = []
    for index, library in enumerate(sys.argv[3:5]):
        lines = subprocess.run(["nm", "-D", "--defined-only", "--demangle", library], capture_output=True, text=True,
                               check=True).stdout.splitlines()
        strong = [line.split(None, 2)[2] for line in lines if len(line.split(None, 2)) == 3 and line.split()[1] in "TDBR"]
        for name in strong:
            if not OURS[index].search(name):
                failures.append(f"{library} exports {name}")
            elif INTERNAL.search(name.split("(")[0]):
                failures.append(f"{library} exports the internal {name}")
        for wanted in WANTED[index]:
            if not any(wanted in name for name in strong):
                failures.append(f"{library} does not export {wanted}")
    print("\n".join(failures) or "both libraries export what is theirs to export")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
