"""The whole walk of a user through zo and a real hub, in the form that programs read."""
import json
import shutil
import subprocess
import unittest

from harness import MEDIA, NOT_FOUND, OK, PARTLY, USAGE, FAILURE, EndToEndTest, every_file


class Walk(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.media = self.root / "media"
        shutil.copytree(MEDIA, self.media)
        self.server = self.hub()
        self.server.add_user("ada", "a long secret")
        self.server.import_folder(self.media, "Harbour Film", "ada")
        self.server.start()
        self.ada = self.user()

    def sign_in(self, *extra):
        password = self.ada.password_file("a long secret")
        return self.ends(self.ada.zo("login", "--server", self.server.url, "--user", "ada", "--password-file",
                                     password, "--json", *extra), OK)

    def test_from_login_to_the_latest_version(self):
        login = self.sign_in().object
        self.assertEqual((login["schema"], login["type"], login["server"], login["user"], login["secure"]),
                         (1, "login", self.server.url, "ada", False))

        self.assertEqual(self.ends(self.ada.zo("whoami", "--json"), OK).object["id"], "ada")
        listed = self.ends(self.ada.zo("productions", "--json"), OK).object
        self.assertEqual((listed["type"], listed["name"], listed["owner"], listed["template"]),
                         ("production", "Harbour Film", "ada", False))
        self.assertEqual(self.ends(self.ada.zo("productions", "--templates", "--json"), OK).objects, [])

        opened = self.ends(self.ada.zo("open", "Harbour Film", "--json"), OK).object
        self.assertTrue(opened["isLatest"])
        self.assertEqual(opened["id"], listed["id"])
        first = opened["commit"]

        shown = self.ends(self.ada.zo("show", "--json"), OK).object
        files = [path for path in every_file(self.media) if path.suffix != ".xmp"]
        folders = [path for path in self.media.rglob("*") if path.is_dir()]
        self.assertEqual(shown["assetsByType"], {"bin": len(folders), "masterclip": len(files)})
        self.assertEqual(shown["assets"], len(files) + len(folders))

        # A second commit: the open production stays where it is until it is moved on.
        sidecar = sorted(self.media.rglob("*.xmp"))[0]
        sidecar.write_bytes(sidecar.read_bytes() + b"\n<!-- graded -->\n")
        self.server.import_folder(self.media, "Harbour Film", "ada")
        behind = self.ends(self.ada.zo("show", "--json"), OK).object
        self.assertEqual((behind["commit"], behind["isLatest"]), (first, False))

        tried = self.ends(self.ada.zo("open", "--latest", "--dry-run", "--json"), OK).object
        self.assertEqual((tried["dryRun"], tried["moved"]), (True, True))
        self.assertEqual(self.ada.zo("show", "--json").object["commit"], first)

        moved = self.ends(self.ada.zo("open", "--latest", "--json"), OK).object
        self.assertEqual((moved["previousCommit"], moved["moved"], moved["isLatest"]), (first, True, True))
        self.assertEqual(moved["commit"], behind["latestCommit"])
        self.assertNotEqual(moved["commit"], first)

        # And back: by identifier and commit.
        back = self.ends(self.ada.zo("open", opened["id"], "--commit", first, "--json"), OK).object
        self.assertEqual((back["commit"], back["isLatest"]), (first, False))
        by_url = self.ends(self.ada.zo("open", listed["url"], "--json"), OK).object
        self.assertEqual(by_url["id"], opened["id"])

    def test_assets_with_all_that_hangs_on_them(self):
        self.sign_in()
        self.ends(self.ada.zo("open", "Harbour Film"), OK)
        assets = {asset["name"]: asset for asset in self.ends(self.ada.zo("assets", "--long", "--json"), OK).objects}
        gulls = assets["gulls.jpg"]
        self.assertEqual(gulls["assetType"], "masterclip")
        self.assertEqual([one["flavour"] for one in gulls["renditions"]], ["image/jpeg"])
        self.assertEqual([one["name"] for one in gulls["enclosures"]], [gulls["mediaLocator"] + "_xmp"])
        self.assertTrue(gulls["mediaHref"])
        self.assertEqual(gulls["parent"], assets["broll"]["id"])

        clips = self.ends(self.ada.zo("assets", "--type", "masterclip", "--parent", "broll", "--json"), OK).objects
        self.assertEqual(sorted(clip["name"] for clip in clips), sorted(
            path.name for path in (self.media / "broll").iterdir() if path.suffix != ".xmp"))
        self.assertEqual(self.ends(self.ada.zo("assets", "--type", "no-such-type", "--json"), OK).objects, [])
        shown = self.ends(self.ada.zo("show", "--asset", "gulls.jpg", "--json"), OK).object
        self.assertEqual(shown, gulls)

    def test_payloads_come_back_byte_for_byte(self):
        self.sign_in()
        self.ends(self.ada.zo("open", "Harbour Film"), OK)
        planned = self.ends(self.ada.zo("get", "--all", "-o", "got/", "--dry-run", "--json"), OK).objects
        self.assertFalse((self.ada.home / "got").exists())
        got = self.ends(self.ada.zo("get", "--all", "-o", "got/", "--json"), OK)
        self.assertEqual([one["path"] for one in planned], sorted((one["path"] for one in got.objects), key=[
            one["path"] for one in planned].index))
        progress = [json.loads(line) for line in got.err.splitlines()]
        self.assertEqual({line["type"] for line in progress}, {"progress"})
        self.assertEqual(progress[-1]["done"], len(planned))

        for record in got.objects:
            path = self.ada.home / record["path"]
            self.assertEqual(record["bytes"], path.stat().st_size)
            relative = path.relative_to(self.ada.home / "got")
            source = self.media / relative
            if path.suffix == ".xmp" and not source.exists():
                source = (self.media / relative.with_suffix("")).with_suffix(".xmp")
            self.assertEqual(path.read_bytes(), source.read_bytes(), record["path"])
        fetched = [path for path in every_file(self.ada.home / "got")]
        self.assertEqual(len(fetched), len(got.objects))
        self.assertEqual(len([path for path in fetched if path.suffix == ".xmp"]),
                         len(list(self.media.rglob("*.xmp"))))

        single = self.ends(self.ada.zo("get", "gulls.jpg", "--rendition", "image/jpeg", "-o", "-"), OK)
        self.assertEqual(single.out, (self.media / "broll" / "gulls.jpg").read_bytes())

    def test_files_are_never_replaced_by_accident(self):
        self.sign_in()
        self.ends(self.ada.zo("open", "Harbour Film"), OK)
        target = self.ada.home / "mine.jpg"
        target.write_bytes(b"mine")
        refused = self.ends(self.ada.zo("get", "gulls.jpg", "--rendition", "image/jpeg", "-o", target, "--json"), FAILURE)
        self.assertIn("exists", refused.errors[0]["message"])
        self.assertEqual(target.read_bytes(), b"mine")
        self.ends(self.ada.zo("get", "gulls.jpg", "--rendition", "image/jpeg", "-o", target, "--force"), OK)
        self.assertEqual(target.read_bytes(), (self.media / "broll" / "gulls.jpg").read_bytes())
        self.assertEqual([path.name for path in self.ada.home.iterdir() if path.name.startswith(".zo-")], [])

        # A folder that cannot be written to: what can be is written, and the exit code says so.
        output = self.ada.home / "partly"
        (output / "broll").mkdir(parents=True)
        (output / "interviews").write_bytes(b"a file where a folder should be")
        partly = self.ends(self.ada.zo("get", "--all", "-o", output, "--json"), PARTLY)
        self.assertTrue(partly.objects)
        self.assertEqual(partly.errors[-1]["error"], "partly-done")
        self.assertTrue((output / "broll" / "gulls.jpg").exists())

    def test_what_is_not_there_and_what_makes_no_sense(self):
        self.ends(self.ada.zo("open", "Harbour Film", "--server", self.server.url), 6)
        self.sign_in()
        self.ends(self.ada.zo("show", "--json"), NOT_FOUND)
        missing = self.ends(self.ada.zo("open", "No Such Film", "--json"), NOT_FOUND).errors[0]
        self.assertEqual((missing["exitCode"], missing["error"], missing["verb"]), (8, "not-found", "open"))
        self.assertIn("No Such Film", missing["message"])
        self.ends(self.ada.zo("open", "Harbour Film"), OK)
        self.ends(self.ada.zo("open", "Harbour Film", "--commit", "0" * 64), NOT_FOUND)
        self.ends(self.ada.zo("get", "no-such-asset"), NOT_FOUND)
        self.ends(self.ada.zo("get", "gulls.jpg", "--enclosure", "nothing"), NOT_FOUND)
        self.ends(self.ada.zo("get", "gulls.jpg", "--all", "--enclosure", "x"), USAGE)
        self.ends(self.ada.zo("get"), USAGE)
        self.ends(self.ada.zo("get", "gulls.jpg", "-o", "-"), USAGE)
        self.ends(self.ada.zo("open", "Harbour Film", "--commit", "../../x"), USAGE)
        self.ends(self.ada.zo("open", "http://other.invalid:1/p"), USAGE)

    def test_over_tls_the_authority_is_remembered(self):
        password = self.ada.password_file("a long secret")
        self.ends(self.ada.zo("login", "--server", self.server.tls_url, "--user", "ada", "--password-file", password,
                              "--ca", self.server.ca_file), OK)
        self.assertTrue(self.ends(self.ada.zo("whoami", "--json"), OK).object["secure"])

    def test_a_full_pipe_end_is_a_failure(self):
        self.sign_in()
        with open("/dev/full", "wb") as full:
            done = subprocess.run([self_zo(), "productions"], stdout=full, stderr=subprocess.PIPE,
                                  env=self.ada.environment, check=False, timeout=120)
        self.assertEqual(done.returncode, FAILURE)
        self.assertIn(b"standard output", done.stderr)


def self_zo():
    import os
    return os.environ["ZO"]


if __name__ == "__main__":
    unittest.main()
