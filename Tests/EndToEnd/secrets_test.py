"""Passwords and tokens stay where they belong."""
import re
import stat
import unittest

from harness import MEDIA, NOT_AUTHENTICATED, OK, PARTLY, EndToEndTest, every_file

PASSWORD = "canary-Pa55word-7f3e"
TOKEN = re.compile(rb"login-token=([0-9A-Za-z]{16,})")


class Secrets(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.server = self.hub()
        self.server.add_user("ada", PASSWORD)
        self.server.import_folder(MEDIA, "Harbour Film", "ada")
        self.server.start()
        self.ada = self.user()
        self.password = self.ada.password_file(PASSWORD)
        # Everything that the library can be made to say is said, on standard error.
        self.ada.environment["ZOCLIENT_TRACE"] = "*:8"

    def login(self, *extra):
        return self.ends(self.ada.zo("login", "--server", self.server.url, "--user", "ada", "--password-file",
                                     self.password, *extra), OK)

    def registry_files(self):
        return [path for path in every_file(self.ada.home) if path.name.startswith("registry")]

    def token(self):
        tokens = {found for path in self.registry_files() for found in TOKEN.findall(path.read_bytes())}
        self.assertTrue(tokens, "the login left no token in the registry")
        return tokens

    def assert_nowhere(self, secrets, but=()):
        for secret in secrets:
            for result in self.ada.said:
                self.assertNotIn(secret, result.out + result.err)
            for path in every_file(self.ada.home):
                if path not in but and path != self.password:
                    self.assertNotIn(secret, path.read_bytes(), f"in {path}")

    def test_a_whole_session_leaves_the_token_in_the_registry_alone(self):
        self.login("--json")
        secrets = self.token()
        self.assertIn(b"<ZOCL", self.ada.zo("productions").err, "nothing was traced")
        for words in (["whoami"], ["productions", "--json"], ["open", "Harbour Film"], ["show"], ["assets", "--long"],
                      ["get", "gulls.jpg", "-o", "got/"], ["open", "Missing"], ["login", "--server", self.server.url,
                       "--user", "ada", "--password-stdin"]):
            self.ada.zo(*words, input=b"canary-wrong-answer\n")
        self.assert_nowhere(secrets | self.token() | {PASSWORD.encode(), b"canary-wrong-answer"},
                            but=self.registry_files())
        for path in self.registry_files():
            self.assertEqual(stat.S_IMODE(path.stat().st_mode), 0o600, path)
            self.assertEqual(stat.S_IMODE(path.parent.stat().st_mode), 0o700, path.parent)
        state = self.ada.home / "state" / "zo.json"
        self.assertEqual(stat.S_IMODE(state.stat().st_mode), 0o600)
        hub_log = (self.server.directory / "hub.log").read_bytes()
        for secret in secrets | {PASSWORD.encode()}:
            self.assertNotIn(secret, hub_log)

    def test_logout_leaves_no_token_on_disk_and_none_that_works(self):
        self.login()
        secrets = self.token()
        self.ends(self.ada.zo("logout"), OK)
        self.assert_nowhere(secrets)
        self.ends(self.ada.zo("productions"), NOT_AUTHENTICATED)
        self.ends(self.ada.zo("logout"), OK)

    def test_logout_without_the_hub_still_removes_the_token(self):
        self.login()
        secrets = self.token()
        self.server.stop()
        self.ends(self.ada.zo("logout", "--json"), PARTLY)
        self.assert_nowhere(secrets)

    def test_a_token_is_given_to_its_own_hub_alone(self):
        self.login()
        other = type(self.server)(self.root / "other")
        other.add_user("ada", "something else")
        other.start()
        self.addCleanup(other.stop)
        self.ends(self.ada.zo("productions", "--server", other.url), NOT_AUTHENTICATED)
        # Signing in elsewhere under the same name asks for the password there and takes no old token along.
        self.ends(self.ada.zo("login", "--server", other.url, "--user", "ada", "--password-stdin",
                              input=b"wrong\n"), NOT_AUTHENTICATED)
        self.ends(self.ada.zo("productions"), OK)
        self.ends(self.ada.zo("login", "--server", other.url, "--user", "ada", "--password-stdin",
                              input=b"something else\n"), OK)
        self.assertEqual(self.ada.zo("productions", "--json").objects, [])
        self.ends(self.ada.zo("productions", "--server", self.server.url), NOT_AUTHENTICATED)

    def test_two_users_of_one_machine_account(self):
        self.server.add_user("bob", "bobs secret")
        self.login()
        self.ends(self.ada.zo("open", "Harbour Film"), OK)
        self.ends(self.ada.zo("login", "--server", self.server.url, "--user", "bob", "--password-stdin",
                              input=b"bobs secret\n"), OK)
        self.assertEqual(self.ends(self.ada.zo("whoami", "--json"), OK).object["user"], "bob")
        self.assertEqual(self.ends(self.ada.zo("whoami", "--user", "ada", "--json"), OK).object["user"], "ada")
        self.assertEqual(self.ends(self.ada.zo("show", "--user", "ada", "--json"), OK).object["name"], "Harbour Film")
        self.ends(self.ada.zo("logout", "--user", "ada"), OK)
        self.ends(self.ada.zo("whoami", "--user", "bob"), OK)


if __name__ == "__main__":
    unittest.main()
