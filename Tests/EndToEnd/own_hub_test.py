"""zo hub: a hub of one's own, started in the background, found again and stopped."""
import os
import signal
import stat
import unittest

from harness import FAILURE, NOT_FOUND, OK, PATIENCE, USAGE, EndToEndTest, every_file


class OwnHub(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.ada = self.user()
        self.addCleanup(lambda: self.ada.zo("hub", "stop"))

    def test_start_use_and_stop(self):
        self.ends(self.ada.zo("hub", "status", "--json"), NOT_FOUND)
        password = self.ada.password_file("my own secret")
        started = self.ends(self.ada.zo("hub", "start", "--port", "0", "--user", "ada", "--password-file", password,
                                        "--json"), OK).object
        self.assertEqual((started["state"], started["started"]), ("running", True))
        self.assertTrue(started["url"].startswith("http://127.0.0.1:"))
        again = self.ends(self.ada.zo("hub", "start", "--port", "0", "--json"), OK).object
        self.assertEqual((again["pid"], again["url"], again["started"]), (started["pid"], started["url"], False))
        self.assertEqual(self.ends(self.ada.zo("hub", "status", "--json"), OK).object["pid"], started["pid"])

        for server, extra in ((started["url"], []), (started["tlsUrl"], ["--ca", started["caFile"]])):
            self.ends(self.ada.zo("login", "--server", server, "--user", "ada", "--password-file", password, *extra), OK)
            self.ends(self.ada.zo("productions"), OK)

        ended = os.pidfd_open(started["pid"])
        stopped = self.ends(self.ada.zo("hub", "stop", "--json"), OK).object
        self.assertEqual((stopped["state"], stopped["stopped"], stopped["pid"]), ("stopped", True, None))
        import select
        self.assertTrue(select.select([ended], [], [], 0)[0], "the hub still runs after stop")
        os.close(ended)
        self.assertFalse(self.ends(self.ada.zo("hub", "stop", "--json"), OK).object["stopped"])
        for path in every_file(self.ada.home / "state"):
            self.assertNotIn(b"my own secret", path.read_bytes())
        data = self.ada.home / "state" / "hub"
        self.assertEqual(stat.S_IMODE(data.stat().st_mode), 0o700)

    def test_a_hub_that_was_killed_is_not_taken_for_running(self):
        started = self.ends(self.ada.zo("hub", "start", "--port", "0", "--json"), OK).object
        ended = os.pidfd_open(started["pid"])
        os.kill(started["pid"], signal.SIGKILL)
        import select
        self.assertTrue(select.select([ended], [], [], PATIENCE)[0])
        os.close(ended)
        self.ends(self.ada.zo("hub", "status"), NOT_FOUND)
        fresh = self.ends(self.ada.zo("hub", "start", "--port", "0", "--json"), OK).object
        self.assertTrue(fresh["started"])

    def test_a_port_that_is_taken_is_told(self):
        started = self.ends(self.ada.zo("hub", "start", "--port", "0", "--json"), OK).object
        port = started["url"].rsplit(":", 1)[1]
        taken = self.ends(self.ada.zo("hub", "start", "--data", "second", "--port", port, "--tls-port", "0", "--json"),
                          FAILURE)
        self.assertIn("ended while it started", taken.errors[0]["message"])
        self.assertIn("--port", taken.errors[0]["hint"])

    def test_dry_run_and_misuse(self):
        self.ends(self.ada.zo("hub", "start", "--dry-run", "--json"), OK)
        self.assertFalse((self.ada.home / "state").exists())
        self.ends(self.ada.zo("hub", "start", "--port", "many"), USAGE)
        self.ends(self.ada.zo("hub", "start", "--user", "ada"), USAGE)
        self.ends(self.ada.zo("hub", "start", ZOCLIENT_ZOHUB="/no/such/program"), NOT_FOUND)


if __name__ == "__main__":
    unittest.main()
