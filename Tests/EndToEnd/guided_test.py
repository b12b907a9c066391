"""The whole way of a share with its user before it: asked, told, merged, decided item by item, commented, shared."""
import fcntl
import os
import re
import select
import time
import unittest

from harness import BEHIND, OK, USAGE
from merge_test import ADA, BASE, BEN
from team_test import CONFLICTS, Team, of_type
from terminal_test import Terminal, width

WAIT = 60
WIDE = "海辺の映画 第一部 とても長い名前のビン その一 その二"
GET_LATEST = "Get Latest Changes (enter)"
SHARE = "[1] Share (enter)  [2] Cancel"
RESOLVE = "[1] Resolve (enter)  [2] "
COMMENT = "Comment: (an empty line ends the text)"
ROWS = "Rows, such as 1,3-5 or all [none]: "
THEIRS, MINE = "1", "3"


class Seat(Terminal):
    """A terminal whose user reads what comes, in its order, and answers."""

    def __init__(self, user, *words, columns=80, **variables):
        super().__init__(user, *words, columns=columns, NO_COLOR="1", **variables)
        self.seen = 0

    def expect(self, pattern):
        """Waits until a text, or what a compiled pattern matches, is said behind what was waited for before."""
        if isinstance(pattern, str):
            pattern = re.compile(re.escape(pattern))
        end = time.monotonic() + WAIT
        while True:
            # Only whole characters count; a piece may end within one.
            said = self.said.decode("utf-8", "ignore").replace("\r\n", "\n")
            found = pattern.search(said, self.seen)
            if found:
                self.seen = found.end()
                return found
            left = end - time.monotonic()
            if left <= 0 or not select.select([self.master], [], [], left)[0] or not self.read():
                raise AssertionError(f"{pattern.pattern!r} was not said: {said!r}")

    def answer(self, question, *lines):
        self.expect(question)
        for line in lines:
            self.type(line.encode() + b"\n")

    def row(self, name):
        """The number of a row of the table that comes next."""
        found = self.expect(re.compile(r"\n +(\d+)  " + re.escape(name)))
        # Other rows may stand above it.
        return found.group(1)

    def decide(self, name, how, before):
        """Settles one conflict of the table; before is the choice that is held."""
        number = self.row(name)
        self.answer(ROWS, number)
        self.answer(f"Number [{before}]: ", how)
        self.answer(RESOLVE, "")

    def hang_up(self):
        """Closes the window of the terminal."""
        os.close(self.master)
        return self.process.wait(WAIT)


class Guided(Team):
    FAULTS = ""

    def hub(self, *options):
        if self.FAULTS:
            script = self.root / "faults"
            script.write_text(self.FAULTS)
            options += ("--faults", script)
        return super().hub(*options)

    def setUp(self):
        super().setUp()
        self.ok(self.ada, "xmp", "set", "lighthouse.jpg", self.file(self.ada, "base.xmp", BASE))
        self.ok(self.ada, "add", "--name", WIDE, "--type", "bin")
        self.share(self.ada)
        self.get_latest(self.ben)

    def part(self):
        """Both change the same metadata, which can be merged, and two items in different ways; ben has shared."""
        self.ok(self.ben, "xmp", "set", "lighthouse.jpg", self.file(self.ben, "ben.xmp", BEN))
        self.ok(self.ben, "set", "--asset", "gulls.jpg", "name=Ben's gulls")
        self.ok(self.ben, "set", "--asset", WIDE, "description=Ben's")
        self.ok(self.ben, "set", "--asset", "slate.png", "description=Only Ben")
        self.share(self.ben, "Ben's day")
        self.ok(self.ada, "xmp", "set", "lighthouse.jpg", self.file(self.ada, "ada.xmp", ADA))
        self.ok(self.ada, "set", "--asset", "gulls.jpg", "name=Ada's gulls")
        self.ok(self.ada, "set", "--asset", WIDE, "description=Ada's")
        self.notes = self.file(self.ada, "notes.bin", os.urandom(70000))
        self.ok(self.ada, "put", self.notes, "--enclosure", "notes.bin", "--asset", "Ada's gulls")

    def heads(self):
        return [self.ok(self.ada, "history", "--count", "1", *line).object["commit"] for line in ((), ("--shared",))]

    def nothing_is_left_behind(self):
        """No transaction, no lock, and the session is where this user has seen it."""
        self.assertEqual(self.ok(self.ada, "pending").objects, [])
        locks = list((self.ada.home / "state").rglob("write-*"))
        self.assertTrue(locks)
        for path in locks:
            with open(path, "r+b") as lock:
                fcntl.flock(lock, fcntl.LOCK_EX | fcntl.LOCK_NB)
        session = self.ok(self.ada, "session", "show", "--dry-run").object
        self.assertFalse(session["transactionOpen"])
        state = next((self.ada.home / "state").rglob("zo.json")).read_text()
        self.assertIn(session["commit"], state)

    def open_conflicts(self):
        return sorted(one["asset"] for one in of_type(self.ada.zo("conflicts", "--json"), "conflict"))

    def end(self, seat, code):
        self.assertEqual(seat.end(), code, seat.said.decode())
        self.nothing_is_left_behind()

    def everything_has_arrived(self, message):
        """Ada kept her gulls and took the bin of ben; what ben gets is what she has, byte for byte."""
        self.assertFalse(self.status(self.ada)["dirty"])
        self.assertTrue(self.status(self.ada)["inSync"])
        self.get_latest(self.ben)
        there = self.assets(self.ben)
        self.assertIn("Ada's gulls", there)
        self.assertNotIn("Ben's gulls", there)
        self.assertEqual((there[WIDE]["description"], there["slate.png"]["description"]), ("Ben's", "Only Ben"))
        self.assertEqual(self.payload(self.ben, "Ada's gulls", "notes.bin"), self.notes.read_bytes())
        packets = [self.ends(user.zo("xmp", "get", "lighthouse.jpg"), OK).out for user in (self.ada, self.ben)]
        self.assertEqual(packets[0], packets[1])
        self.file(self.ada, "got.xmp", packets[1])
        merged = self.ends(self.ada.zo("xmp", "merge", "base.xmp", self.ben.home / "ben.xmp", "ada.xmp"), OK).out
        self.file(self.ada, "merged.xmp", merged)
        self.assertEqual(self.ends(self.ada.zo("xmp", "diff", "merged.xmp", "got.xmp"), OK).text, "")
        newest = self.ok(self.ben, "history", "--count", "1").object
        self.assertEqual((newest["committer"], newest["message"]), ("ada", message))


class TheWholeWay(Guided):
    def walk(self, columns):
        self.part()
        seat = Seat(self.ada, "share", columns=columns)
        seat.answer(GET_LATEST, "")
        seat.expect("got 4 changes of others")
        seat.expect("merged the metadata of 1 item")
        seat.expect(re.compile(r"Ada's gulls\n  mine    updated \(name\) by ada, .*\n  theirs  updated \(name\) by ben, "))
        seat.expect("Resolve Conflicts: Harbour Film")
        seat.decide("Ada's gulls", MINE, THEIRS)
        seat.decide(WIDE[:6], THEIRS, MINE)
        seat.answer("All conflicts were successfully resolved.", "")
        seat.expect('Share "Harbour Film"')
        seat.expect("lighthouse.jpg XMP")
        seat.answer(COMMENT, "Ada's day", "海 at dawn", "")
        seat.answer(SHARE, "")
        seat.expect(re.compile(r"shared 3 changes of Harbour Film \(commit [0-9a-f]+\)"))
        self.end(seat, OK)
        for line in seat.said.decode().replace("\r\n", "\n").splitlines():
            if "Ada's gulls  " in line or WIDE[:6] in line:
                self.assertLessEqual(width(line), columns, line)
        # The narrow table cuts the long name, the wide one has room for it.
        self.assertEqual(re.search(r"\d  " + WIDE[:6] + r"[^\n]*\u2026 ", seat.said.decode()) is not None, columns < 100)
        self.everything_has_arrived("Ada's day\n海 at dawn")

    def test_in_a_narrow_window(self):
        self.walk(60)

    def test_in_a_wide_window(self):
        self.walk(200)

    def test_in_single_steps(self):
        self.part()
        before = self.heads()
        got = Seat(self.ada, "latest", "--interactive")
        got.decide("Ada's gulls", MINE, THEIRS)
        got.expect(WIDE[:6])
        # No row, so that nothing but an end is left, or the way back.
        got.answer(ROWS, "")
        got.answer("Number [3]: ", "")
        got.answer("[1] Stop Resolving  (enter goes back", "")
        got.answer(ROWS, "")
        got.answer("Number [3]: ", "")
        got.answer("[1] Stop Resolving", "1")
        got.expect("1 item still in conflict")
        self.end(got, CONFLICTS)
        self.assertEqual(self.open_conflicts(), [WIDE])
        self.assertEqual(self.heads()[1], before[1])

        decided = Seat(self.ada, "resolve")
        decided.decide(WIDE[:6], THEIRS, THEIRS)
        decided.answer("All conflicts were successfully resolved.", "")
        decided.expect("no conflict remains")
        self.end(decided, OK)
        again = Seat(self.ada, "resolve", "-i")
        again.expect("nothing is in conflict")
        self.end(again, OK)
        nothing_newer = Seat(self.ada, "latest", "-i")
        nothing_newer.expect("there is nothing newer")
        self.end(nothing_newer, OK)

        shared = Seat(self.ada, "share", "-i")
        shared.answer(COMMENT, "In steps", "")
        shared.answer(SHARE, "")
        shared.expect("shared 3 changes")
        self.end(shared, OK)
        self.everything_has_arrived("In steps")
        nothing = Seat(self.ada, "share")
        nothing.expect("there is nothing to share")
        self.end(nothing, OK)

    def test_without_a_question(self):
        self.part()
        # At a terminal, too.
        behind = Seat(self.ada, "share", "--no-input")
        self.end(behind, BEHIND)
        self.ends(self.ada.zo("share"), BEHIND)
        pulled = Seat(self.ada, "latest")
        self.end(pulled, CONFLICTS)
        undecided = Seat(self.ada, "resolve", "--no-input", "--all")
        self.assertEqual(undecided.end(), USAGE)
        for seat in (behind, pulled, undecided):
            for question in (GET_LATEST, ROWS, COMMENT):
                self.assertNotIn(question.encode(), seat.said)
        self.ends(self.ada.zo("resolve", "--all"), USAGE)
        self.ends(self.ada.zo("share", "-m", "x"), CONFLICTS)
        self.ends(self.ada.zo("resolve", "--mine", "Ada's gulls"), CONFLICTS)
        self.ends(self.ada.zo("resolve", "--theirs", "--all"), OK)
        self.assertTrue(self.share(self.ada, "In silence")["shared"])
        self.everything_has_arrived("In silence")

    def test_where_nobody_can_be_asked_interactive_is_an_error(self):
        for words in (("share",), ("latest",), ("resolve",)):
            self.assertIn("needs a terminal", self.ends(self.ada.zo(*words, "-i"), USAGE).error_text)
        for words in (("share", "-m", "x"), ("share", "--json"), ("share", "--dry-run"), ("latest", "--quiet"),
                      ("latest", "--strategy", "mine"), ("resolve", "--no-input"), ("resolve", "--mine"),
                      ("resolve", "gulls.jpg")):
            seat = Seat(self.ada, *words, "--interactive")
            self.assertEqual(seat.end(), USAGE, seat.said)
        self.ok(self.ada, "set", "--asset", "gulls.jpg", "name=Gulls", "--keep-open")
        for words in (("share",), ("latest", "-i"), ("resolve",)):
            seat = Seat(self.ada, *words)
            self.assertEqual(seat.end(), 1, seat.said)
            self.assertIn(b"zo commit", seat.said)

    def test_when_nothing_is_left_no_comment_is_asked_for(self):
        self.ok(self.ben, "set", "--asset", "gulls.jpg", "name=Ben's gulls")
        self.share(self.ben)
        self.ok(self.ada, "set", "--asset", "gulls.jpg", "name=Ada's gulls")
        seat = Seat(self.ada, "share")
        seat.answer(GET_LATEST, "")
        seat.decide("Ada's gulls", THEIRS, THEIRS)
        seat.answer("All conflicts were successfully resolved.", "")
        seat.expect("nothing is left to share")
        self.end(seat, OK)
        self.assertNotIn(COMMENT.encode(), seat.said)


if __name__ == "__main__":
    unittest.main()
