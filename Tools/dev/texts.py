#!/usr/bin/env python3
"""Compares the dictionaries in Resources/texts with the texts of the code and of the layouts.

Tells the keys that a language lacks, those that nothing uses, texts whose marks (@0 to @9) differ from the
English ones, and keys that stand with two English texts. Ends with 1 when there is anything to tell.
texts.py --list writes all keys with their English texts, in the form of a dictionary.
"""
import pathlib
import re
import sys

FOLDERS = ["API", "Inc", "Platform", "Resources/layouts", "Src", "Tools"]
TOKEN = re.compile(r"""//[^\n]*|/\*.*?\*/|R"([^(\s]*)\(.*?\)\1"|"(?:\\.|[^"\\\n])*"|'(?:\\.|[^'\\\n])*'""", re.S)
ESCAPE = re.compile(rb"\\(x[0-9A-Fa-f]{2}|.)", re.S)
ESCAPED = {b"n": b"\n", b"t": b"\t"}
KEY_MARK = "$$$/"
MARK = re.compile(r"@\d")
DICTIONARY_ESCAPES = [("\\", "\\\\"), ("\n", "\\n"), ("\t", "\\t")]


def unescape(literal):
    def replace(match):
        what = match.group(1)
        return bytes([int(what[1:], 16)]) if len(what) == 3 else ESCAPED.get(what, what)
    return ESCAPE.sub(replace, literal.encode()).decode()


def literals(text):
    """The quoted texts of a source, those that follow each other joined, with the place of the first."""
    joined, start, end = None, 0, -1
    for match in TOKEN.finditer(text):
        token = match.group()
        if token.startswith(("//", "/*")):
            continue
        between = re.sub(r"//[^\n]*|/\*.*?\*/", "", text[end:match.start()], flags=re.S) if end >= 0 else "x"
        value = token[1:-1] if token[0] in "\"'" else ""
        if joined is not None and not between.strip():
            joined += value
        else:
            if joined is not None:
                yield start, joined
            joined, start = value, match.start()
        end = match.end()
    if joined is not None:
        yield start, joined


def used_texts(source, problems):
    texts = {}
    for folder in FOLDERS:
        for path in sorted((source / folder).rglob("*")):
            if path.suffix not in (".cpp", ".h", ".lyra"):
                continue
            content = path.read_text(encoding="utf-8")
            for start, literal in literals(content):
                if not literal.startswith(KEY_MARK) or literal == KEY_MARK:
                    continue
                place = f"{path.relative_to(source)}:{content.count(chr(10), 0, start) + 1}"
                key, equals, text = unescape(literal).partition("=")
                if not equals:
                    problems.append(f"{place}: {key} has no English text")
                elif texts.setdefault(key, (text, place))[0] != text:
                    problems.append(f"{place}: {key} has another English text at {texts[key][1]}")
    return texts


def read_dictionary(path, problems):
    texts = {}
    for number, line in enumerate(path.read_text(encoding="utf-8").splitlines(), 1):
        key, equals, text = line.partition("=")
        if not line or line.startswith("#"):
            continue
        if not equals or not key.startswith(KEY_MARK):
            problems.append(f"{path.name}:{number}: is no key=text")
        elif key in texts:
            problems.append(f"{path.name}:{number}: {key} stands twice")
        elif re.search(r"\\(?![nt\\])", text.replace("\\\\", "")):
            problems.append(f"{path.name}:{number}: {key} has an unknown escape")
        texts[key] = text
    return texts


def compare(name, used, dictionary):
    for key in sorted(used.keys() - dictionary.keys()):
        yield f"{name} lacks {key} ({used[key][1]}: {used[key][0]!r})"
    for key in sorted(dictionary.keys() - used.keys()):
        yield f"{name} has {key}, which nothing uses"
    for key in sorted(used.keys() & dictionary.keys()):
        if set(MARK.findall(used[key][0])) != set(MARK.findall(dictionary[key])):
            yield f"{name}: the marks of {key} are not those of {used[key][0]!r}"


def as_dictionary_line(key, text):
    for plain, escaped in DICTIONARY_ESCAPES:
        text = text.replace(plain, escaped)
    return f"{key}={text}"


def main():
    source = pathlib.Path(__file__).resolve().parents[2]
    problems = []
    used = used_texts(source, problems)
    if "--list" in sys.argv[1:]:
        print("\n".join(as_dictionary_line(key, text) for key, (text, _) in sorted(used.items())))
        return 0
    dictionaries = sorted((source / "Resources/texts").glob("*.txt"))
    for path in dictionaries:
        problems += compare(path.name, used, read_dictionary(path, problems))
    if not used or not dictionaries:
        problems.append("found no texts, or no dictionary")
    print("\n".join(problems) or f"{len(used)} texts, {len(dictionaries)} dictionaries: nothing is missing")
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main())
