"""zo while the hub is away: before a person it waits, for a script it gives up after 15 seconds."""
import json
import time
import unittest

from fake_hub import FakeHub
from harness import CANCELLED, NETWORK, OK, PATIENCE, EndToEndTest
from terminal_test import Terminal

WAITING = b"waiting until it is back"


class Outage(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.hub = FakeHub()
        self.addCleanup(self.hub.close)
        self.ada = self.user()
        self.ends(self.ada.zo("login", "--server", self.hub.url, "--user", "ada", "--password-stdin",
                              input=b"secret\n"), OK)
        self.hub.statuses["/p"] = 503

    def test_a_script_is_told_after_fifteen_seconds(self):
        began = time.monotonic()
        plain = self.ada.start("productions")
        quiet = Terminal(self.ada, "productions", "--quiet")
        asjson = Terminal(self.ada, "productions", "--json")
        out, err = plain.communicate(timeout=PATIENCE)
        took = time.monotonic() - began
        self.assertEqual(plain.returncode, NETWORK, (out, err))
        self.assertGreater(took, 15)
        self.assertLess(took, 60)
        self.assertIn(b"trying for 15 seconds", err)
        self.assertIn(b"for more than 15 seconds", err)
        self.assertIn(b"next: ", err)
        self.assertEqual(out, b"")
        # A terminal alone makes no person.
        self.assertEqual(quiet.end(), NETWORK, quiet.said)
        self.assertEqual(asjson.end(), NETWORK, asjson.said)
        for terminal in (quiet, asjson):
            self.assertNotIn(b"waiting", terminal.said)
        self.assertEqual(json.loads(asjson.said.splitlines()[-1])["error"], "network")

    def test_a_person_is_told_and_the_work_goes_on(self):
        terminal = Terminal(self.ada, "productions")
        terminal.wait_for(WAITING)
        del self.hub.statuses["/p"]
        self.assertEqual(terminal.end(), OK, terminal.said)
        self.assertIn(b"Fake", terminal.said)

    def test_a_person_need_not_wait(self):
        terminal = Terminal(self.ada, "productions")
        terminal.wait_for(WAITING)
        terminal.type(b"\x03")
        self.assertEqual(terminal.end(), CANCELLED, terminal.said)


if __name__ == "__main__":
    unittest.main()
