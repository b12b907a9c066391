"""The way of a share with its user before it, broken off at every step: nothing is lost and nothing left open."""
import re
import time
import unittest

from guided_test import COMMENT, GET_LATEST, MINE, RESOLVE, ROWS, SHARE, THEIRS, WIDE, Guided, Seat
from harness import BEHIND, CANCELLED, CHANGED, NOT_AUTHENTICATED, OK
from team_test import CONFLICTS


class BrokenOff(Guided):
    def pull(self):
        self.ends(self.ada.zo("latest"), CONFLICTS)
        self.conflicts = self.open_conflicts()
        self.assertEqual(self.conflicts, ["Ada's gulls", WIDE])

    def settle(self):
        self.ends(self.ada.zo("resolve", "--mine", "--all"), OK)

    def at_the_comment(self):
        seat = Seat(self.ada, "share")
        seat.answer(COMMENT, "half a com")
        seat.expect("  ")
        return seat

    def test_a_no_at_each_question(self):
        self.part()
        before = self.heads()
        seat = Seat(self.ada, "share")
        seat.answer(GET_LATEST, "2")
        seat.expect("nothing was shared")
        self.end(seat, CANCELLED)
        self.assertEqual(self.heads(), before)

        seat = Seat(self.ada, "share")
        seat.answer(GET_LATEST, "cancel".upper())
        self.end(seat, CANCELLED)
        self.assertEqual(self.heads(), before)

        seat = Seat(self.ada, "share")
        seat.answer(GET_LATEST, "1")
        seat.answer(ROWS, "")
        seat.answer("Number [1]: ", "")
        seat.answer("[1] Cancel", "1")
        seat.expect("2 items still in conflict")
        self.end(seat, CONFLICTS)
        pulled = self.heads()
        self.assertNotEqual(pulled[0], before[0])

        seat = Seat(self.ada, "share")
        seat.answer("Resolve Conflicts (enter)", "2")
        self.end(seat, CONFLICTS)
        self.assertEqual(self.heads(), pulled)
        self.settle()

        settled = self.heads()
        seat = self.at_the_comment()
        seat.type(b"\n")
        seat.answer(SHARE, "2")
        seat.expect("nothing was shared")
        self.end(seat, CANCELLED)
        # The end of the input is a no, too.
        for question in (COMMENT, SHARE):
            seat = Seat(self.ada, "share")
            if question == SHARE:
                seat.answer(COMMENT, "")
            seat.expect(question)
            seat.type(b"\x04")
            self.end(seat, CANCELLED)
        self.assertEqual(self.heads(), settled)
        self.assertTrue(self.share(self.ada)["shared"])

    def test_an_interrupt_at_each_question(self):
        self.part()
        before = self.heads()
        seat = Seat(self.ada, "share")
        seat.expect(GET_LATEST)
        seat.type(b"\x03")
        seat.expect("cancelled")
        self.end(seat, CANCELLED)
        self.assertEqual(self.heads(), before)
        self.pull()

        # What was decided before stays decided, and counts as seen.
        seat = Seat(self.ada, "resolve")
        seat.decide("Ada's gulls", MINE, THEIRS)
        seat.expect(ROWS)
        seat.type(b"1\x03")
        self.end(seat, CANCELLED)
        self.assertEqual(self.open_conflicts(), [WIDE])
        self.settle()

        settled = self.heads()
        seat = self.at_the_comment()
        seat.type(b"ment\x03")
        self.end(seat, CANCELLED)
        self.assertTrue(self.ok(self.ada, "diff").objects)
        self.assertEqual(self.heads(), settled)
        self.assertTrue(self.share(self.ada)["shared"])

    def test_a_terminal_that_goes_away(self):
        self.part()
        self.pull()
        pulled = self.heads()
        seat = Seat(self.ada, "resolve")
        seat.expect(ROWS)
        self.assertEqual(seat.hang_up(), CANCELLED)
        self.nothing_is_left_behind()
        self.assertEqual((self.open_conflicts(), self.heads()), (self.conflicts, pulled))
        self.settle()
        settled = self.heads()
        self.assertEqual(self.at_the_comment().hang_up(), CANCELLED)
        self.nothing_is_left_behind()
        self.assertEqual(self.heads(), settled)

    def test_somebody_is_faster_at_the_last_moment(self):
        self.part()
        self.pull()
        self.settle()
        seat = self.at_the_comment()
        self.ok(self.ben, "set", "--asset", "room-tone.wav", "name=Tone")
        self.share(self.ben)
        seat.type(b"\n")
        seat.answer(SHARE, "")
        seat.answer(re.compile(r"A newer version of the\s+production exists"), "")
        seat.answer(re.compile(r"\[1\] Share \(enter\)  \[2\] Cancel|Comment"), "-", "")
        seat.answer(SHARE, "2")
        self.end(seat, BEHIND)

    def test_the_session_is_moved_from_elsewhere(self):
        self.part()
        self.pull()
        self.settle()
        elsewhere = self.sign_in("ada", "ada-elsewhere")
        seat = self.at_the_comment()
        self.ok(elsewhere, "set", "--asset", "slate.png", "name=From elsewhere", "-m", "From the train")
        seat.type(b"\n")
        seat.answer(SHARE, "")
        seat.answer("unexpected", "")
        seat.expect(COMMENT)
        seat.type(b"\x04")
        seat.expect("From the train")
        self.assertEqual(seat.end(), CHANGED)
        # The next one does not even ask for a comment, until it was looked at.
        seat = Seat(self.ada, "share")
        seat.expect("From the train")
        self.assertEqual(seat.end(), CHANGED)
        self.assertNotIn(COMMENT.encode(), seat.said)
        self.status(self.ada)
        self.assertTrue(self.share(self.ada)["shared"])

    def test_a_login_that_ends_on_the_way(self):
        self.part()
        self.pull()
        self.settle()
        seat = self.at_the_comment()
        self.ends(self.ada.zo("logout"), OK)
        seat.type(b"\n")
        seat.answer(SHARE, "")
        seat.answer("There was an error while sharing", "")
        seat.expect(COMMENT)
        seat.type(b"\x04")
        self.assertEqual(seat.end(), NOT_AUTHENTICATED, seat.said)
        self.assertNotIn(b"assword", seat.said)


class InTheMiddleOfAStep(Guided):
    # The second pull is the one of the test: it and the first decision come late.
    FAULTS = "on POST rel accept-theirs nth 1 do delay 4s\non POST rel /sessions/session#pull nth 2 do delay 4s\n"

    def take_all(self):
        seat = Seat(self.ada, "resolve")
        seat.answer(ROWS, "all")
        seat.answer("Number [1]: ", THEIRS)
        seat.answer(RESOLVE, "")
        seat.expect('Resolving "')
        seat.type(b"\x03")
        seat.expect("Cancelling")
        return seat

    def test_an_interrupt_ends_after_what_is_under_way(self):
        self.part()
        before = self.heads()
        seat = Seat(self.ada, "share")
        seat.answer(GET_LATEST, "")
        seat.expect("Getting latest version")
        seat.type(b"\x03")
        self.end(seat, CANCELLED)
        self.assertNotIn(ROWS.encode(), seat.said)
        # The pull came to its end, and is known here.
        self.assertNotEqual(self.heads()[0], before[0])
        self.end(self.take_all(), CANCELLED)
        self.assertEqual(len(self.open_conflicts()), 2)


class WhereAStepHangs(InTheMiddleOfAStep):
    FAULTS = "on POST rel accept-theirs nth 1 do delay 60s\n"

    def test_an_interrupt_ends_after_what_is_under_way(self):
        """But a second one ends at once."""
        self.part()
        self.ends(self.ada.zo("latest"), CONFLICTS)
        began = time.monotonic()
        seat = self.take_all()
        seat.type(b"\x03")
        self.assertEqual(seat.end(), CANCELLED)
        self.assertLess(time.monotonic() - began, 50)


class InAnOutage(Guided):
    # One share of the preparation, then eight failures in a row.
    FAULTS = "".join(f"on POST rel /sessions/session#push nth {number} do answer 503\n" for number in range(2, 10))

    def press_share(self):
        self.ok(self.ada, "set", "--asset", "slate.png", "description=Ada's")
        seat = Seat(self.ada, "share")
        seat.answer(COMMENT, "Through thick and thin", "")
        seat.answer(SHARE, "")
        seat.expect(re.compile(r"Communication with\s+the Meridane"))
        return seat

    def test_a_share_goes_on_when_the_hub_is_back(self):
        seat = self.press_share()
        seat.expect("shared 1 change of Harbour Film")
        self.end(seat, OK)
        # The window has said it, so nobody else does.
        self.assertNotIn(b"waiting until it is back", seat.said)


class InAnOutageWithoutEnd(InAnOutage):
    FAULTS = "on POST rel /sessions/session#push from 2 do answer 503\n"

    def test_a_share_goes_on_when_the_hub_is_back(self):
        """It is never back: the user gives up, by the button or by an interrupt."""
        before = self.heads()
        for way in (b"1\n", b"\x03"):
            seat = self.press_share()
            seat.expect("[1] Sign Out")
            seat.type(way)
            self.end(seat, CANCELLED)
            self.assertEqual(self.heads()[1], before[1])


class WithALostAnswer(InAnOutage):
    # The hub shares, and is heard of no more.
    FAULTS = "on POST rel /sessions/session#push nth 2 do drop-reply\n" \
             "on POST rel /sessions/session#push from 2 do answer 503\n"

    def test_a_share_goes_on_when_the_hub_is_back(self):
        """Who gives up then is told the truth."""
        seat = self.press_share()
        seat.expect("[1] Sign Out")
        seat.type(b"\x03")
        seat.expect("shared 1 change of Harbour Film")
        self.end(seat, OK)
        state = self.status(self.ada)
        self.assertEqual((state["dirty"], state["inSync"]), (False, True))


if __name__ == "__main__":
    unittest.main()
