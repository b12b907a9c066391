"""zo ingest: a folder of media comes into the session once, whole, and again only as far as it is missing."""
import json
import os
import pathlib
import signal
import unittest

from harness import CANCELLED, FAILURE, MEDIA, NOT_FOUND, OK, PARTLY, PATIENCE, USAGE, EndToEndTest

PACKET = (b'<x:xmpmeta xmlns:x="adobe:ns:meta/"><rdf:RDF xmlns:rdf="http://www.w3.org/1999/02/22-rdf-syntax-ns#">'
          b'<rdf:Description rdf:about="" xmlns:dc="http://purl.org/dc/elements/1.1/" dc:source="%s"/>'
          b'</rdf:RDF></x:xmpmeta>\n')
NO_BULK = {"ZOCLIENT_DEBUG_ZOClient_EnableBulkAPI": "false"}


def of_type(result, kind):
    return [one for one in result.objects if one["type"] == kind]


class IngestTest(EndToEndTest):
    faults = ""

    def setUp(self):
        super().setUp()
        options = []
        if self.faults:
            script = self.root / "faults"
            script.write_text(self.faults)
            options = ["--faults", script]
        self.server = self.hub(*options)
        self.server.add_user("ada", "secret")
        (self.root / "nothing").mkdir()
        for film in ("Film", "Other Film"):
            self.server.import_folder(self.root / "nothing", film, "ada")
        self.server.import_folder(MEDIA, "Imported", "ada")
        self.server.start()
        self.ada = self.user()
        self.ends(self.ada.zo("login", "--server", self.server.url, "--user", "ada", "--password-file",
                              self.ada.password_file("secret")), OK)
        self.open("Film")

    def open(self, film):
        self.ends(self.ada.zo("open", film), OK)

    def folder(self, files, name="rushes"):
        root = self.root / name
        for path, content in files.items():
            (root / path).parent.mkdir(parents=True, exist_ok=True)
            (root / path).write_bytes(content)
        return root

    def rushes(self, count, name="rushes"):
        files = {}
        for number in range(count):
            files[f"day {number % 3}/clip{number:03}.mov"] = b"media %d" % number
            files[f"day {number % 3}/clip{number:03}.xmp"] = PACKET % (b"clip %d" % number)
        return self.folder(files, name)

    def ingest(self, *words, code=OK, **variables):
        result = self.ends(self.ada.zo("ingest", *words, "--json", **variables), code)
        (summary,) = of_type(result, "ingest")
        return result, summary

    def counts(self, summary):
        return {key: summary[key] for key in ("added", "updated", "present", "failed", "remaining") if summary[key]}

    def tree(self):
        """All that the session holds, by the path of each asset, in a form that does not depend on identifiers."""
        assets = {one["id"]: one for one in self.ends(self.ada.zo("assets", "--long", "--json"), OK).objects}

        def path(asset):
            parent = assets.get(asset["parent"])
            return (path(parent) + "/" if parent else "") + asset["name"]
        tree = {path(one): (one["assetType"], one["mediaHref"], one["mediaName"], sorted(
            (part["name"].replace(one["mediaLocator"], "*"), part["contentId"]) for part in one["enclosures"]), sorted(
                (part["flavour"], part["contentId"]) for part in one["renditions"])) for one in assets.values()}
        self.assertEqual(len(tree), len(assets))
        return tree

    def nothing_is_pending(self):
        self.assertEqual(self.ends(self.ada.zo("pending", "--json"), OK).objects, [])


class WhatComes(IngestTest):
    def test_the_same_as_an_import_in_bulk_and_one_by_one(self):
        self.open("Imported")
        imported = self.tree()
        self.open("Film")
        planned, would = self.ingest(MEDIA, "--dry-run")
        self.assertEqual(self.tree(), {})
        result, summary = self.ingest(MEDIA)
        self.assertEqual((self.counts(summary), summary["bins"], summary["transactions"]), ({"added": 6}, 2, 1))
        self.assertEqual(self.counts(would), self.counts(summary))
        self.assertEqual([(one["path"], one["state"], one["sidecar"]) for one in of_type(planned, "ingested")],
                         [(one["path"], one["state"], one["sidecar"]) for one in of_type(result, "ingested")])
        self.assertEqual(self.tree(), imported)
        self.open("Other Film")
        self.ingest(MEDIA, **NO_BULK)
        self.assertEqual(self.tree(), imported)

    def test_again_it_adds_only_what_is_missing(self):
        root = self.rushes(9)
        (root / "day 0" / "clip000.xmp").unlink()
        self.ends(self.ada.zo("add", "--name", "Rushes", "--type", "bin"), OK)
        _, first = self.ingest(root, "--parent", "Rushes")
        self.assertEqual(self.counts(first), {"added": 9})
        before = self.tree()
        _, again = self.ingest(root, "--parent", "Rushes")
        self.assertEqual((self.counts(again), again["transactions"]), ({"present": 9}, 0))
        self.assertEqual(self.tree(), before)

        # A clip that was renamed is still the file's; a new file and a new sidecar come along.
        self.ends(self.ada.zo("set", "--asset", "clip004.mov", "name=Opening"), OK)
        (root / "day 9").mkdir()
        (root / "day 9" / "late.wav").write_bytes(b"late")
        (root / "day 0" / "clip000.xmp").write_bytes(PACKET % b"late")
        result, late = self.ingest(root, "--parent", "Rushes")
        self.assertEqual(self.counts(late), {"added": 1, "updated": 1, "present": 8})
        self.assertEqual({one["path"] for one in of_type(result, "ingested") if one["state"] != "present"},
                         {"day 9", "day 9/late.wav", "day 0/clip000.mov"})
        self.assertEqual(self.ends(self.ada.zo("xmp", "get", "clip000.mov"), OK).out, PACKET % b"late")

        # A sidecar that was changed is left alone, since people may have changed the packet; unless asked for.
        (root / "day 1" / "clip001.xmp").write_bytes(PACKET % b"graded")
        self.assertEqual(self.counts(self.ingest(root, "--parent", "Rushes")[1]), {"present": 10})
        for variables in ({}, NO_BULK):
            with self.subTest(variables):
                _, graded = self.ingest(root, "--parent", "Rushes", "--update", **variables)
                self.assertEqual(self.counts(graded), {"updated": 1, "present": 9})
                self.assertEqual(self.ends(self.ada.zo("xmp", "get", "clip001.mov"), OK).out,
                                 (root / "day 1" / "clip001.xmp").read_bytes())
            (root / "day 1" / "clip001.xmp").write_bytes(PACKET % b"graded again")
        self.nothing_is_pending()

    def test_after_an_import_of_the_same_folder_nothing_is_missing(self):
        self.open("Imported")
        self.assertEqual(self.counts(self.ingest(MEDIA)[1]), {"present": 6})

    def test_usage(self):
        root = self.rushes(1)
        self.ends(self.ada.zo("ingest"), USAGE)
        self.ends(self.ada.zo("ingest", root / "day 0" / "clip000.mov"), USAGE)
        self.ends(self.ada.zo("ingest", root / "nowhere"), NOT_FOUND)
        self.ends(self.ada.zo("ingest", root, "--parent", "nowhere"), NOT_FOUND)
        self.ends(self.ada.zo("ingest", root, "--batch", "0"), USAGE)
        self.ends(self.ada.zo("set", "description=x", "--keep-open"), OK)
        self.assertIn("transaction of yours is open", self.ends(self.ada.zo("ingest", root), FAILURE).error_text)


class WhatDoesNotCome(IngestTest):
    def test_hostile_folders(self):
        root = self.rushes(3)
        (root / "loop").symlink_to(root)
        (root / "secret.mov").symlink_to("/etc/passwd")
        os.mkfifo(root / "pipe.mov")
        (root / ".hidden.mov").write_bytes(b"hidden")
        self.folder({"notes.txt": b"x", "alone.xmp": PACKET % b"x", "empty.mov": b"", "empty.xmp": b"",
                     "fake.jpg": b"no picture", "broken.mov": b"x", "broken.xmp": b"<x:xmpmeta", "huge.mov": b"x"})
        with open(root / "huge.xmp", "wb") as huge:
            huge.truncate((16 << 20) + 1)
        (pathlib.Path(os.fsdecode(os.fsencode(root) + b"/bad\xff.mov"))).write_bytes(b"x")
        (root / "line\nbreak.mov").write_bytes(b"x")

        result, summary = self.ingest(root, code=PARTLY)
        self.assertEqual(self.counts(summary), {"added": 7, "failed": 2})
        states = {one["path"]: (one["state"], one["reason"]) for one in of_type(result, "ingested")}
        for path, (state, reason) in {
                "loop": ("left-out", "symbolic link"), "secret.mov": ("left-out", "symbolic link"),
                "pipe.mov": ("left-out", "regular"), "notes.txt": ("left-out", "media"),
                "alone.xmp": ("left-out", "sidecar"), "empty.mov": ("added", "empty"),
                "fake.jpg": ("added", "extension"), "broken.mov": ("added", "no XMP packet"),
                "huge.mov": ("added", "larger"), "bad\ufffd.mov": ("failed", "name"),
                "line?break.mov": ("failed", "name")}.items():
            self.assertEqual(states[path][0], state, path)
            self.assertIn(reason, states[path][1], path)
        self.assertEqual(len(result.errors), 5)
        self.assertEqual(result.errors[-1]["error"], "partly-done")
        tree = self.tree()
        self.assertEqual([path for path, (_, _, _, packets, _) in tree.items() if "/" not in path and packets], [])
        self.assertEqual(tree["fake.jpg"][4], [])

        # Mended, the same command brings the rest.
        (root / "broken.xmp").write_bytes(PACKET % b"mended")
        (root / "huge.xmp").write_bytes(PACKET % b"small")
        for path in os.listdir(os.fsencode(root)):
            if b"\xff" in path or b"\n" in path:
                os.unlink(os.path.join(os.fsencode(root), path))
        self.assertEqual(self.counts(self.ingest(root)[1]), {"updated": 2, "present": 5})
        self.assertEqual(self.ends(self.ada.zo("xmp", "get", "broken.mov"), OK).out, PACKET % b"mended")


class OneRefusedLocator(IngestTest):
    faults = "on POST rel /medialocators nth 4 do answer 400\n"

    def test_does_not_stop_the_others(self):
        root = self.rushes(9)
        result, summary = self.ingest(root, code=PARTLY)
        self.assertEqual(self.counts(summary), {"added": 8, "failed": 1})
        self.assertEqual([one["status"] for one in result.errors], [400, 0])
        self.assertEqual(self.counts(self.ingest(root)[1]), {"added": 1, "present": 8})


class BulkRefused(IngestTest):
    faults = ("on POST rel /bulk#create parts 11 nth 1 do answer 400\n"
              "on POST rel /assets/asset#create nth 5 do answer 400\n")

    def test_goes_on_file_by_file_and_names_the_one(self):
        root = self.rushes(9)
        result, summary = self.ingest(root, code=PARTLY)
        self.assertEqual(self.counts(summary), {"added": 8, "failed": 1})
        self.assertRegex(result.errors[0]["message"], r"day \d/clip\d{3}\.mov")
        self.assertEqual(len(self.tree()), 11)
        self.assertEqual(self.counts(self.ingest(root)[1]), {"added": 1, "present": 8})


class LostAnswer(IngestTest):
    faults = "on POST rel /bulk#create first 2 do drop-reply\n"

    def test_nothing_comes_twice(self):
        root = self.rushes(9)
        self.assertEqual(self.counts(self.ingest(root)[1]), {"added": 9})
        self.assertEqual(len(self.tree()), 12)


class Interrupted(IngestTest):
    faults = "on POST rel /bulk#create parts 11 nth 3 do stall 600s\n"

    def test_whole_transactions_stay_and_the_rest_comes_with_the_next_run(self):
        root = self.rushes(40)
        process = self.ada.start("ingest", str(root), "--batch", "10", "--json")
        self.addCleanup(process.kill)
        while json.loads(process.stderr.readline())["done"] < 30:
            pass
        # The third form is under way, or about to be, and is never answered.
        process.send_signal(signal.SIGINT)
        out, err = process.communicate(timeout=PATIENCE)
        self.assertEqual(process.returncode, CANCELLED, (out, err))
        self.assertEqual([json.loads(line)["remaining"] for line in out.splitlines() if b'"ingest"' in line], [20])
        self.nothing_is_pending()
        self.assertEqual(len([path for path in self.tree() if path.endswith(".mov")]), 20)

        _, rest = self.ingest(root, "--batch", "15")
        self.assertEqual((self.counts(rest), rest["transactions"]), ({"added": 20, "present": 20}, 2))
        resumed = self.tree()
        self.open("Other Film")
        self.ingest(root)
        self.assertEqual(self.tree(), resumed)


if __name__ == "__main__":
    unittest.main()
