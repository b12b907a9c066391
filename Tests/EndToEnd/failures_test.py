"""Every exit code for a real cause."""
import os
import pathlib
import signal
import socket
import subprocess
import threading
import unittest

from fake_hub import FakeHub
from harness import (BEHIND, CANCELLED, CHANGED, FAILURE, MEDIA, NETWORK, NOT_AUTHENTICATED, NOT_FOUND, NOT_PERMITTED,
                     OK, PATIENCE, TLS, USAGE, EndToEndTest, closed_port, every_file)


class Failures(EndToEndTest):
    def login(self, user, server, *extra, password="secret"):
        return user.zo("login", "--server", server, "--user", "ada", "--password-file", user.password_file(password),
                       "--json", *extra)

    def fake(self, **options):
        hub = FakeHub(**options)
        self.addCleanup(hub.close)
        return hub

    def test_usage(self):
        ada = self.user()
        for words in (["frobnicate"], ["open", "a", "b"], ["productions", "--no-such-option"], ["hub"], [],
                      ["hub", "dance"], ["login", "--color", "blue"], ["whoami"], ["show", "--asset"],
                      ["login", "--server", "http://ada:pw@host", "--user", "ada"],
                      ["login", "--server", "ftp://host", "--user", "ada"],
                      ["login", "--server", "https://host", "--user", "ada", "--plain"],
                      ["login", "--server", "http://hub.example", "--user", "ada", "--password-stdin"],
                      ["login", "--server", "https://host", "--user", "ada"]):
            result = self.ends(ada.zo("--json", *words), USAGE)
            self.assertEqual(result.out, b"", words)
            self.assertEqual(result.errors[0]["error"], "usage", words)
        self.assertIn("did you mean 'productions'", ada.zo("produtcions").error_text)

    def test_wrong_password_and_a_login_that_ended(self):
        hub = self.hub("--token-lifetime", "3600")
        hub.add_user("ada", "secret")
        hub.start()
        ada = self.user()
        refused = self.ends(self.login(ada, hub.url, password="wrong"), NOT_AUTHENTICATED)
        self.assertIn("password", refused.errors[0]["hint"])
        self.ends(ada.zo("productions"), USAGE)

        self.ends(self.login(ada, hub.url), OK)
        self.ends(ada.zo("productions"), OK)
        # With a good token on disk a wrong password must still be refused, and the token survives that.
        self.ends(self.login(ada, hub.url, password="wrong"), NOT_AUTHENTICATED)
        self.ends(ada.zo("productions"), OK)

    def test_an_expired_token(self):
        hub = self.hub("--token-lifetime", "5")
        hub.add_user("ada", "secret")
        hub.start()
        ada = self.user()
        self.ends(self.login(ada, hub.url), OK)
        while (result := ada.zo("productions", "--json")).code == OK:
            pass
        self.ends(result, NOT_AUTHENTICATED)
        self.assertIn("zo login", result.errors[0]["hint"])

    def test_the_production_of_another_user(self):
        hub = self.hub()
        hub.add_user("ada", "secret")
        hub.add_user("bob", "secret")
        said = hub.import_folder(MEDIA, "Bob's Film", "bob")
        hub.start()
        identifier = said.split("production ")[1].split()[0]
        ada = self.user()
        self.ends(self.login(ada, hub.url), OK)
        self.assertEqual(self.ends(ada.zo("productions", "--json"), OK).objects, [])
        self.assertIn(ada.zo("open", identifier).code, (NOT_PERMITTED, NOT_FOUND))
        self.ends(ada.zo("open", "Bob's Film"), NOT_FOUND)

    def test_statuses_of_a_hub(self):
        hub = self.fake()
        ada = self.user()
        # What a hub that fails for good is worth, without the patience that it is met with.
        ada.environment["ZOCLIENT_DEBUG_ZOClient_DisableRetries"] = "true"
        self.ends(self.login(ada, hub.url), OK)
        for status, code in ((401, NOT_AUTHENTICATED), (403, NOT_PERMITTED), (404, NOT_FOUND), (409, BEHIND),
                             (410, NOT_FOUND), (412, CHANGED), (500, FAILURE), (418, FAILURE)):
            hub.statuses["/p"] = status
            result = self.ends(ada.zo("productions", "--json"), code)
            self.assertEqual(result.errors[0]["status"], status)

    def test_a_server_that_is_no_hub(self):
        hub = self.fake()
        hub.statuses["/content/zo/api/discovery.json"] = 404
        self.ends(self.login(self.user(), hub.url), NOT_FOUND)

    def test_no_hub_at_all(self):
        keeper, port = closed_port()
        self.addCleanup(keeper.close)
        refused = self.ends(self.login(self.user(), f"http://127.0.0.1:{port}"), NETWORK)
        self.assertIn("could not be reached", refused.errors[0]["message"])
        self.ends(self.login(self.user(), "https://no-such-host.invalid"), NETWORK)

    def test_an_authority_that_is_not_trusted(self):
        hub = self.hub()
        hub.add_user("ada", "secret")
        hub.start()
        other = type(hub)(self.root / "other")
        other.add_user("x", "y")
        other.start()
        self.addCleanup(other.stop)
        ada = self.user()
        for extra in ([], ["--ca", other.ca_file]):
            refused = self.ends(self.login(ada, hub.tls_url, *extra), TLS)
            self.assertIn("certificate", refused.errors[0]["message"])
        self.ends(self.login(ada, hub.tls_url, "--ca", "no-such-file"), TLS)
        # TLS spoken to the plain port.
        self.ends(self.login(ada, hub.url.replace("http://", "https://")), TLS)
        # The order: the flag beats the environment, ZOCLIENT_CA_FILE beats SSL_CERT_FILE.
        ada.environment["SSL_CERT_FILE"] = other.ca_file
        self.ends(self.login(ada, hub.tls_url), TLS)
        ada.environment["ZOCLIENT_CA_FILE"] = hub.ca_file
        self.ends(self.login(ada, hub.tls_url), OK)
        ada.environment["ZOCLIENT_CA_FILE"] = other.ca_file
        self.ends(self.login(ada, hub.tls_url, "--ca", hub.ca_file), OK)
        del ada.environment["ZOCLIENT_CA_FILE"], ada.environment["SSL_CERT_FILE"]
        pathlib.Path(ada.environment["ZOCLIENT_CONFIG_HOME"]).mkdir(exist_ok=True)
        bob = self.user("bob")
        (bob.home / "config").mkdir()
        (bob.home / "config" / "zo.conf").write_text(f"# trust\nca = {hub.ca_file}\n")
        self.ends(self.login(bob, hub.tls_url), OK)

    def interrupted(self, user, hub, *words):
        process = user.start(*words)
        self.addCleanup(process.kill)
        self.assertTrue(hub.stalled_reached.wait(PATIENCE), "the request never came")
        process.send_signal(signal.SIGINT)
        out, err = process.communicate(timeout=PATIENCE)
        self.assertEqual(process.returncode, CANCELLED, (out, err))

    def test_ctrl_c_while_a_hub_is_silent(self):
        hub = self.fake(names=("clip", "other"))
        ada = self.user()
        hub.stalled = {"/content/zo/api/discovery.json"}
        self.interrupted(ada, hub, "login", "--server", hub.url, "--user", "ada", "--password-file",
                         ada.password_file("secret"))
        self.assertEqual([path for path in every_file(ada.home) if b"fake-hub-token" in path.read_bytes()], [])

        hub.stalled, hub.stalled_reached = set(), threading.Event()
        self.ends(self.login(ada, hub.url), OK)
        self.ends(ada.zo("open", "Fake"), OK)
        hub.stalled = {"/payload/1/0"}
        self.interrupted(ada, hub, "get", "--all", "-o", "got/")
        left = [path.name for path in every_file(ada.home / "got")] if (ada.home / "got").exists() else []
        self.assertEqual([name for name in left if name != "clip.notes"], [], "half files are left")

    def test_ctrl_c_while_a_connection_hangs(self):
        listener = socket.socket()
        self.addCleanup(listener.close)
        listener.bind(("127.0.0.1", 0))
        listener.listen()
        ada = self.user()
        process = ada.start("login", "--server", f"https://127.0.0.1:{listener.getsockname()[1]}", "--user", "ada",
                            "--password-file", ada.password_file("secret"))
        self.addCleanup(process.kill)
        connection, _ = listener.accept()
        self.addCleanup(connection.close)
        self.assertTrue(connection.recv(1))
        process.send_signal(signal.SIGTERM)
        process.communicate(timeout=PATIENCE)
        self.assertEqual(process.returncode, CANCELLED)


class HostileNames(EndToEndTest):
    def test_names_from_the_hub_stay_inside_the_folder(self):
        names = ("../../escape", "/etc/absolute", "..", ".", "a/b\\c", "\x1b[31mred", "nul\x00byte", "x" * 300,
                 "CON", "same", "same", "Same", " trailing. ", "-rf", "\u202egnp.exe")
        hub = FakeHub(names=names, enclosures=("../up", "..", "/abs", "plain"))
        self.addCleanup(hub.close)
        ada = self.user("home/deep/inside")
        self.ends(ada.zo("login", "--server", hub.url, "--user", "ada", "--password-file",
                         ada.password_file("secret")), OK)
        self.ends(ada.zo("open", "Fake"), OK)
        before = {path for path in every_file(self.root)}
        got = self.ends(ada.zo("get", "--all", "-o", "got/", "--json"), OK)
        # The cache of payloads names its files by hashes of its own.
        cache = ada.home / "cache"
        new = {path for path in every_file(self.root) if cache not in path.parents} - before
        inside = {path for path in new if (ada.home / "got") in path.parents}
        self.assertEqual(new - inside, set())
        self.assertEqual(len(inside), len(names) * 4)
        self.assertEqual(len({record["path"] for record in got.objects}), len(names) * 4)
        for path in inside:
            self.assertNotIn("\x1b", path.name)
            self.assertFalse(path.name.startswith("."), path.name)
        # On a page for people no control character of the hub's gets through.
        for words in (("assets",), ("assets", "--long"), ("get", "--all", "-o", "two/")):
            said = self.ends(ada.zo(*words), OK)
            for character in ("\x1b", "\x00", "\u202e"):
                self.assertNotIn(character, said.text + said.error_text)


if __name__ == "__main__":
    unittest.main()
