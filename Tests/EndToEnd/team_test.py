"""Two users on one production, each with a session and a state directory, through zo and a real hub."""
import json
import os
import shutil
import signal
import unittest

from harness import (BEHIND, CANCELLED, CHANGED, MEDIA, NOT_FOUND, OK, PATIENCE, USAGE, EndToEndTest)
from terminal_test import Terminal

CONFLICTS = 3
PACKET = (b'<x:xmpmeta xmlns:x="adobe:ns:meta/"><rdf:RDF xmlns:rdf="http://www.w3.org/1999/02/22-rdf-syntax-ns#">'
          b'<rdf:Description rdf:about=""/></rdf:RDF></x:xmpmeta>\n')


def packet_of(source):
    """The packet with one property, so that those of two users contradict one another."""
    return PACKET.replace(b'<rdf:Description rdf:about=""/>',
                          b'<rdf:Description rdf:about="" xmlns:dc="http://purl.org/dc/elements/1.1/"><dc:source>' +
                          source + b'</dc:source></rdf:Description>')


def of_type(result, kind):
    return [one for one in result.objects if one["type"] == kind]


class Team(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.media = self.root / "media"
        shutil.copytree(MEDIA, self.media)
        self.server = self.hub()
        for name in ("ada", "ben"):
            self.server.add_user(name, "a long secret of " + name)
        self.server.command("import", self.media, "--production", "Harbour Film", "--owner", "ada", "--grant", "ben")
        self.server.start()
        self.ada = self.sign_in("ada", "ada-home")
        self.ben = self.sign_in("ben", "ben-home")

    def sign_in(self, name, home):
        user = self.user(home)
        password = user.password_file("a long secret of " + name)
        self.ends(user.zo("login", "--server", self.server.url, "--user", name, "--password-file", password), OK)
        self.ends(user.zo("open", "Harbour Film"), OK)
        return user

    def ok(self, user, *words):
        return self.ends(user.zo(*words, "--json"), OK)

    def assets(self, user, *words):
        return {one["name"]: one for one in self.ok(user, "assets", *words).objects}

    def status(self, user):
        return self.ok(user, "status").object

    def file(self, user, name, content):
        path = user.home / name
        path.write_bytes(content)
        return path

    def payload(self, user, asset, enclosure):
        return self.ends(user.zo("get", asset, "--enclosure", enclosure, "-o", "-"), OK).out

    def share(self, user, message="Shared"):
        return of_type(self.ok(user, "share", "-m", message), "share")[0]

    def get_latest(self, user):
        return of_type(self.ok(user, "latest"), "latest")[0]


class Walk(Team):
    def test_from_the_first_change_to_the_other_side(self):
        first = self.ok(self.ada, "show").object["commit"]
        before = self.status(self.ada)
        self.assertEqual((before["session"], before["dirty"], before["inSync"]), ("", False, True))
        self.ends(self.ada.zo("session", "show", "--json"), NOT_FOUND)

        clip = self.ada.home / "pier.jpg"
        shutil.copy(self.media / "broll" / "gulls.jpg", clip)
        self.file(self.ada, "pier.xmp", PACKET)
        planned = self.ok(self.ada, "add", clip, "--parent", "broll", "--dry-run")
        self.assertEqual([one["type"] for one in planned.objects], ["added", "transaction"])
        self.ends(self.ada.zo("session", "show"), NOT_FOUND)
        added = self.ok(self.ada, "add", clip, "--parent", "broll", "-m", "The pier")
        end = of_type(added, "transaction")[0]
        self.assertEqual((end["state"], end["message"], end["changes"]), ("committed", "The pier", 1))
        self.ok(self.ada, "set", "--asset", "pier.jpg", "description=At dawn", "tags=day,sea")
        notes = self.file(self.ada, "notes.bin", os.urandom(70000))
        self.ok(self.ada, "put", notes, "--enclosure", "notes.bin", "--asset", "pier.jpg")
        self.ok(self.ada, "put", notes, "--enclosure", "plan.bin")
        self.ok(self.ada, "set", "description=Second cut")
        self.ok(self.ada, "rm", "room-tone.wav")

        state = self.status(self.ada)
        self.assertEqual((state["dirty"], state["inSync"], state["conflicts"], state["dirtyCertain"],
                          state["inSyncCertain"]), (True, True, False, True, True))
        changes = {(one["kind"], one["change"], one["asset"], one["name"]) for one in self.ok(self.ada, "diff").objects}
        self.assertIn(("asset", "added", "pier.jpg", ""), changes)
        self.assertIn(("asset", "removed", "room-tone.wav", ""), changes)
        self.assertIn(("enclosure", "added", "pier.jpg", "notes.bin"), changes)
        self.assertIn(("enclosure", "added", "", "plan.bin"), changes)
        self.assertIn("properties", [kind for kind, *_ in changes])

        # Nobody else sees it before it is shared.
        self.assertNotIn("pier.jpg", self.assets(self.ben))
        self.assertNotIn("pier.jpg", self.assets(self.ada, "--shared"))
        tried = of_type(self.ok(self.ada, "share", "-m", "x", "--dry-run"), "share")[0]
        self.assertEqual((tried["dryRun"], tried["shared"], tried["behind"]), (True, False, False))
        shared = self.share(self.ada, "With the pier")
        self.assertTrue(shared["shared"])
        self.assertFalse(self.share(self.ada)["shared"])
        self.assertFalse(self.status(self.ada)["dirty"])

        got = self.get_latest(self.ben)
        self.assertEqual((got["baseCommit"], got["conflicts"]), (shared["commit"], 0))
        there = self.assets(self.ben, "--long")
        self.assertNotIn("room-tone.wav", there)
        self.assertEqual((there["pier.jpg"]["description"], there["pier.jpg"]["tags"]), ("At dawn", ["day", "sea"]))
        self.assertEqual(self.payload(self.ben, "pier.jpg", "notes.bin"), notes.read_bytes())
        self.assertEqual(self.ends(self.ben.zo("xmp", "get", "pier.jpg"), OK).out, PACKET)
        picture = self.ends(self.ben.zo("get", "pier.jpg", "--rendition", "image/jpeg", "-o", "-"), OK)
        self.assertEqual(picture.out, clip.read_bytes())

        for line in ((), ("--shared",)):
            newest = self.ok(self.ben, "history", "--count", "1", *line).object
            self.assertEqual((newest["commit"], newest["committer"], newest["message"]),
                             (shared["commit"], "ada", "With the pier"))
        between = self.ok(self.ben, "diff", "--from", first, "--to", shared["commit"]).objects
        self.assertEqual({(one["kind"], one["change"], one["asset"], one["name"]) for one in between}, changes)
        self.ends(self.ben.zo("diff", "--from", "../x"), USAGE)

    def test_history_tells_where_a_commit_of_the_session_was_made(self):
        self.ok(self.ada, "set", "--asset", "gulls.jpg", "description=Loud", "-m", "Louder")
        version = self.ok(self.ada, "history", "--count", "1").object
        self.assertEqual((version["message"], version["committer"], version["application"], version["transactionType"]),
                         ("Louder", "ada", "zo", "edit"))
        self.assertTrue(version["machine"])
        self.assertTrue(version["title"].startswith("{"))

    def test_a_transaction_over_several_verbs(self):
        self.ends(self.ada.zo("commit"), NOT_FOUND)
        opened = of_type(self.ok(self.ada, "set", "--asset", "gulls.jpg", "name=Gulls", "--keep-open"), "transaction")[0]
        self.assertEqual(opened["state"], "open")
        self.ok(self.ada, "set", "--asset", "lighthouse.jpg", "name=Light")
        self.assertLessEqual({"Gulls", "Light"}, set(self.assets(self.ada)))
        self.assertFalse(self.status(self.ada)["dirty"])
        pending = self.ok(self.ada, "pending").object
        self.assertEqual((pending["owner"], pending["application"], pending["leftOpenHere"]), ("ada", "zo", True))
        for refused in (("share", "-m", "x"), ("latest",), ("open", "Harbour Film")):
            self.ends(self.ada.zo(*refused), 1)
        done = of_type(self.ok(self.ada, "commit", "-m", "Names"), "transaction")[0]
        self.assertEqual(self.ok(self.ada, "pending").objects, [])
        newest = self.ok(self.ada, "history", "--count", "1").object
        self.assertEqual((newest["commit"], newest["message"]), (done["commit"], "Names"))

        self.ok(self.ada, "rm", "Gulls", "--keep-open")
        self.assertNotIn("Gulls", self.assets(self.ada))
        self.ok(self.ada, "rollback")
        self.assertIn("Gulls", self.assets(self.ada))
        self.assertEqual(self.ok(self.ada, "history", "--count", "1").object["commit"], done["commit"])
        for path in (self.ada.home / "state").rglob("zo.json"):
            self.assertEqual(path.stat().st_mode & 0o777, 0o600)

    def test_behind_and_moved_from_elsewhere(self):
        self.ok(self.ben, "set", "--asset", "gulls.jpg", "name=Ben's gulls")
        self.ok(self.ada, "set", "--asset", "lighthouse.jpg", "name=Light")
        self.share(self.ada)
        behind = self.ends(self.ben.zo("share", "-m", "x", "--json"), BEHIND).errors[-1]
        self.assertEqual((behind["error"], behind["status"]), ("behind", 409))
        self.assertFalse(self.status(self.ben)["inSync"])
        self.get_latest(self.ben)

        # The same user at another machine: what he did there has to be seen before it is shared here.
        elsewhere = self.sign_in("ben", "ben-elsewhere")
        self.ok(elsewhere, "set", "--asset", "anna-take1.mp4", "name=Take 1", "-m", "From the train")
        moved = self.ends(self.ben.zo("share", "-m", "x", "--json"), CHANGED).errors[-1]
        self.assertEqual(moved["error"], "session-changed")
        self.assertIn("From the train", moved["message"])
        self.status(self.ben)
        self.assertTrue(self.share(self.ben)["shared"])
        self.get_latest(self.ada)
        self.assertLessEqual({"Ben's gulls", "Light", "Take 1"}, set(self.assets(self.ada)))

    def test_discarding_needs_a_yes(self):
        self.ok(self.ada, "set", "--asset", "gulls.jpg", "name=Gone soon")
        self.ends(self.ada.zo("session", "discard", "--json"), USAGE)
        self.ok(self.ada, "session", "discard", "--dry-run")
        self.assertIn("Gone soon", self.assets(self.ada))
        self.ok(self.ada, "session", "discard", "--yes")
        self.assertNotIn("Gone soon", self.assets(self.ada))
        self.ends(self.ada.zo("session", "show"), NOT_FOUND)


class Conflicts(Team):
    def setUp(self):
        super().setUp()
        packet = self.file(self.ada, "ada.xmp", packet_of(b"ada"))
        self.file(self.ben, "ben.xmp", packet_of(b"ben"))
        self.ok(self.ada, "set", "--asset", "gulls.jpg", "name=Ada's gulls")
        self.ok(self.ada, "xmp", "set", "lighthouse.jpg", packet)
        self.ok(self.ada, "set", "--asset", "slate.png", "name=Both the same")
        self.ok(self.ada, "set", "--asset", "harbour-wide.mp4", "description=Only Ada")
        self.ok(self.ada, "rm", "room-tone.wav")
        self.ok(self.ben, "set", "--asset", "gulls.jpg", "name=Ben's gulls", "description=Quiet")
        self.ok(self.ben, "xmp", "set", "lighthouse.jpg", "ben.xmp")
        self.ok(self.ben, "set", "--asset", "slate.png", "name=Both the same")
        self.ok(self.ben, "set", "--asset", "anna-take1.mp4", "description=Only Ben")
        self.ok(self.ben, "set", "--asset", "room-tone.wav", "description=Do not remove")
        self.share(self.ada, "Ada's changes")

    def test_a_dry_run_names_who_when_and_what_and_changes_nothing(self):
        before = (self.status(self.ben), self.ok(self.ben, "history", "--count", "50").objects)
        tried = self.ok(self.ben, "latest", "--dry-run")
        self.assertEqual(of_type(tried, "latest")[0]["conflicts"], 3)
        found = {one["asset"] if one["kind"] == "asset" else "xmp": one for one in of_type(tried, "conflict")}
        self.assertEqual(len(found), 3)
        gulls = next(one for one in found.values() if "name" in one["mine"]["parts"])
        self.assertEqual((gulls["state"], gulls["mine"]["committer"], gulls["theirs"]["committer"]),
                         ("predicted", "ben", "ada"))
        self.assertEqual((gulls["mine"]["parts"], gulls["theirs"]["parts"]), (["description", "name"], ["name"]))
        for one in found.values():
            self.assertRegex(one["mine"]["committed"] + one["theirs"]["committed"], r"^(\d{4}-\d\d-\d\dT[\d:]+Z){2}$")
        self.assertEqual((found["xmp"]["kind"], found["xmp"]["asset"]), ("enclosure", "lighthouse.jpg"))
        removed = next(one for one in found.values() if one["theirs"]["change"] == "removed")
        self.assertEqual((removed["mine"]["change"], removed["mine"]["parts"]), ("updated", ["description"]))
        self.assertEqual((self.status(self.ben), self.ok(self.ben, "history", "--count", "50").objects), before)

        # And it was right: the pull brings just these.
        predicted = {(one["kind"], one["assetId"], one["name"]) for one in found.values()}
        self.assertEqual(self.ends(self.ben.zo("latest", "--strategy", "safe"), CONFLICTS).code, CONFLICTS)
        pulled = self.ends(self.ben.zo("latest", "--json"), CONFLICTS)
        opened = {(one["kind"], one["assetId"], one["name"]) for one in of_type(pulled, "conflict")}
        self.assertEqual(opened, predicted)
        sides = {one["asset"]: (one["mine"]["committer"], one["theirs"]["committer"])
                 for one in of_type(self.ends(self.ben.zo("conflicts", "--json"), CONFLICTS), "conflict")}
        self.assertEqual(set(sides.values()), {("ben", "ada")})
        self.ends(self.ben.zo("share", "-m", "x"), CONFLICTS)

    def test_mine_theirs_and_a_copy(self):
        self.ends(self.ben.zo("latest"), CONFLICTS)
        self.ends(self.ben.zo("resolve", "--mine"), USAGE)
        self.ends(self.ben.zo("resolve", "--mine", "no-such-thing"), NOT_FOUND)
        rest = self.ends(self.ben.zo("resolve", "--mine", "lighthouse.jpg", "--json"), CONFLICTS)
        self.assertEqual([one["decision"] for one in of_type(rest, "conflict")], ["mine"])
        gulls = next(one for one in of_type(self.ends(self.ben.zo("conflicts", "--json"), CONFLICTS), "conflict")
                     if "name" in one["mine"]["parts"])
        copied = self.ends(self.ben.zo("resolve", "--copy", gulls["assetId"], "--json"), CONFLICTS)
        copy = of_type(copied, "conflict")[0]["copy"]
        self.ok(self.ben, "resolve", "--theirs", "--all")
        self.assertEqual(self.ok(self.ben, "conflicts").objects, [])
        self.share(self.ben, "Resolved")

        self.get_latest(self.ada)
        assets = self.assets(self.ada, "--long")
        self.assertIn("Ada's gulls", assets)
        self.assertIn("Ben's gulls", copy)
        self.assertEqual(assets[copy]["description"], "Quiet")
        self.assertEqual([one["name"] for one in assets[copy]["enclosures"]],
                         [one["name"] for one in assets["Ada's gulls"]["enclosures"]])
        self.assertEqual(self.ends(self.ada.zo("get", copy, "--rendition", "image/jpeg", "-o", "-"), OK).out,
                         (self.media / "broll" / "gulls.jpg").read_bytes())
        self.assertNotIn("room-tone.wav", assets)
        self.assertEqual(self.ends(self.ada.zo("xmp", "get", "lighthouse.jpg"), OK).out, packet_of(b"ben"))
        self.assertEqual(assets["anna-take1.mp4"]["description"], "Only Ben")
        self.assertEqual(assets["harbour-wide.mp4"]["description"], "Only Ada")


class BeforeAPerson(Team):
    def test_somebody_elses_transaction_is_waited_for_or_discarded(self):
        elsewhere = self.sign_in("ada", "ada-elsewhere")
        self.ok(elsewhere, "set", "--asset", "slate.png", "name=From elsewhere", "--keep-open")
        asked = Terminal(self.ada, "set", "--asset", "gulls.jpg", "name=From here")
        asked.wait_for(b"Waiting for changes to be saved by ada on ")
        asked.wait_for(b"Close Production")
        self.assertFalse(self.ok(self.ada, "pending").object["leftOpenHere"])
        asked.type(b"Discard Changes\n")
        asked.wait_for(b"cannot be undone")
        asked.type(b"Yes\n")
        self.assertEqual(asked.end(), OK, asked.said)
        self.assertIn("From here", self.assets(self.ada))
        self.ends(elsewhere.zo("commit"), CHANGED)

        # Where nobody can be asked it waits, and goes on when the other is done.
        self.ok(elsewhere, "set", "--asset", "slate.png", "name=From elsewhere", "--keep-open")
        waiting = self.ada.start("set", "--asset", "lighthouse.jpg", "name=Waited", "--json")
        self.ok(elsewhere, "commit")
        out, err = waiting.communicate(timeout=PATIENCE)
        self.assertEqual(waiting.returncode, OK, err)
        self.assertLessEqual({"From elsewhere", "Waited"}, set(self.assets(self.ada)))

    def test_a_discard_is_asked_for_and_conflicts_are_readable(self):
        self.ok(self.ada, "set", "--asset", "gulls.jpg", "name=Ada's gulls")
        self.ok(self.ben, "set", "--asset", "gulls.jpg", "name=Ben's gulls")
        self.share(self.ben)
        shown = Terminal(self.ada, "latest", "--dry-run", columns=60)
        self.assertEqual(shown.end(), OK)
        self.assertRegex(shown.said.decode(), r"mine +updated \(name\) by ada, \d{4}-.*\r\n +theirs +updated \(name\) by ben, ")
        for answer, code in ((b"\n", CANCELLED), (b"y\n", OK)):
            asked = Terminal(self.ada, "session", "discard")
            asked.wait_for(b"[y/N] ")
            asked.type(answer)
            self.assertEqual(asked.end(), code, asked.said)
        self.ends(self.ada.zo("session", "show"), NOT_FOUND)


class CutOff(Team):
    FILES = 400

    def start_big_add(self):
        """A big add that has got some way: the first files are told of as done."""
        folder = self.ada.home / "big"
        folder.mkdir()
        for number in range(self.FILES):
            (folder / f"{number:04}.jpg").write_bytes(b"\xff\xd8\xff" + number.to_bytes(4, "big") * 500)
        process = self.ada.start("add", *sorted(folder.iterdir()), "--json")
        self.addCleanup(process.stdout.close)
        self.addCleanup(process.stderr.close)
        for _ in range(3):
            line = json.loads(process.stderr.readline())
            self.assertEqual((line["type"], line["total"]), ("progress", self.FILES))
        return process

    def test_an_interrupt_leaves_no_transaction(self):
        process = self.start_big_add()
        process.send_signal(signal.SIGINT)
        out, err = process.communicate(timeout=PATIENCE)
        self.assertEqual((process.returncode, out), (CANCELLED, b""), err)
        self.assertEqual(self.ok(self.ada, "pending").objects, [])
        self.assertFalse(self.status(self.ada)["dirty"])

    def test_what_a_kill_leaves_is_cleared_by_the_next_change(self):
        process = self.start_big_add()
        process.kill()
        process.communicate(timeout=PATIENCE)
        left = self.ok(self.ada, "pending").object
        self.assertEqual((left["application"], left["leftOpenHere"]), ("zo", False))
        self.ok(self.ada, "set", "--asset", "gulls.jpg", "name=After the kill")
        self.assertEqual(self.ok(self.ada, "pending").objects, [])
        self.assertEqual([one["asset"] for one in self.ok(self.ada, "diff").objects], ["After the kill"])

    def test_watching_tells_of_what_others_share(self):
        self.ok(self.ben, "set", "--asset", "gulls.jpg", "name=Watched")
        watch = self.ada.start("watch", "--count", "1", "--interval", "50")
        self.assertIn(b"watching", watch.stderr.readline())
        self.share(self.ben, "Look here")
        out, _ = watch.communicate(timeout=PATIENCE)
        self.assertEqual(watch.returncode, OK)
        self.assertIn(b"Look here", out)
        self.ok(self.ada, "watch", "--for", "1")


if __name__ == "__main__":
    unittest.main()
