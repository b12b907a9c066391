"""xmp merge and xmp diff: packets in files, without a hub, a login or any state."""
import subprocess
import unittest

from harness import FAILURE, NOT_FOUND, OK, PATIENCE, USAGE, ZO, EndToEndTest

CONFLICTS = 3


def packet(**properties):
    """A packet with one property of dc: for each word."""
    elements = "".join(f"<dc:{name}>{value}</dc:{name}>" for name, value in properties.items())
    return ('<x:xmpmeta xmlns:x="adobe:ns:meta/"><rdf:RDF xmlns:rdf="http://www.w3.org/1999/02/22-rdf-syntax-ns#">'
            '<rdf:Description rdf:about="" xmlns:dc="http://purl.org/dc/elements/1.1/">' + elements +
            "</rdf:Description></rdf:RDF></x:xmpmeta>").encode()


class XmpFiles(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.ada = self.user()
        self.write("base.xmp", packet(format="a", source="a"))
        self.write("theirs.xmp", packet(format="b", source="a"))
        self.write("mine.xmp", packet(format="a", source="b"))
        self.write("other.xmp", packet(format="c", source="c"))
        self.write("both.xmp", packet(format="b", source="b"))

    def tearDown(self):
        for place in ("config", "state", "cache"):
            self.assertFalse((self.ada.home / place).exists(), place)

    def write(self, name, data):
        (self.ada.home / name).write_bytes(data)

    def read(self, name):
        return (self.ada.home / name).read_bytes()

    def test_a_merge_takes_both_sides_and_goes_to_standard_output_or_a_file(self):
        merged = self.ends(self.ada.zo("xmp", "merge", "base.xmp", "theirs.xmp", "mine.xmp"), OK)
        self.assertEqual(merged.err, b"")
        self.ends(self.ada.zo("xmp", "merge", "base.xmp", "theirs.xmp", "mine.xmp", "-o", "merged.xmp"), OK)
        self.assertEqual(self.read("merged.xmp"), merged.out)
        same = self.ends(self.ada.zo("xmp", "diff", "both.xmp", "merged.xmp"), OK)
        self.assertEqual((same.out, same.err), (b"", b""))
        # A file is never replaced by accident, and wholly or not at all.
        self.ends(self.ada.zo("xmp", "merge", "base.xmp", "base.xmp", "base.xmp", "-o", "merged.xmp"), FAILURE)
        self.assertEqual(self.read("merged.xmp"), merged.out)
        self.ends(self.ada.zo("xmp", "merge", "base.xmp", "theirs.xmp", "merged.xmp", "-o", "merged.xmp", "--force"), OK)
        self.assertEqual(self.read("merged.xmp"), merged.out)
        piped = self.ends(self.ada.zo("xmp", "merge", "base.xmp", "-", "mine.xmp", input=self.read("theirs.xmp")), OK)
        self.assertEqual(piped.out, merged.out)
        told = self.ends(self.ada.zo("xmp", "merge", "base.xmp", "theirs.xmp", "mine.xmp", "--json"), OK).object
        self.assertEqual((told["type"], told["text"].encode(), told["bytes"], told["path"], told["conflicts"]),
                         ("xmpMerge", merged.out, len(merged.out), "", []))

    def test_what_cannot_be_merged_is_listed_and_mine_stays(self):
        left = self.ends(self.ada.zo("xmp", "merge", "base.xmp", "both.xmp", "other.xmp", "-o", "out.xmp"), CONFLICTS)
        self.assertIn("not merged: dc:format (changed on both sides)", left.error_text)
        self.assertIn("not merged: dc:source (changed on both sides)", left.error_text)
        self.assertIn("2 properties could not be merged", left.error_text)
        self.assertEqual(self.ends(self.ada.zo("xmp", "diff", "other.xmp", "out.xmp"), OK).out, b"")
        told = self.ends(self.ada.zo("xmp", "merge", "--json", "base.xmp", "both.xmp", "other.xmp"), CONFLICTS)
        self.assertEqual(told.object["conflicts"], [{"path": "dc:format", "reason": "changed-on-both-sides"},
                                                    {"path": "dc:source", "reason": "changed-on-both-sides"}])
        self.assertEqual([error["exitCode"] for error in told.errors], [CONFLICTS])
        self.write("less.xmp", packet(source="a"))
        removed = self.ends(self.ada.zo("xmp", "merge", "--json", "base.xmp", "both.xmp", "less.xmp"), CONFLICTS).object
        self.assertEqual(removed["conflicts"], [{"path": "dc:format", "reason": "removed-by-mine"}])

    def test_differences(self):
        self.write("more.xmp", packet(format="b", rights="<rdf:Alt><rdf:li xml:lang='x-default'>r</rdf:li></rdf:Alt>"))
        lines = self.ends(self.ada.zo("xmp", "diff", "base.xmp", "more.xmp"), OK).text.splitlines()
        self.assertEqual([line.split()[:2] for line in lines[1:]],
                         [["changed", "dc:format"], ["added", "dc:rights"], ["removed", "dc:source"]])
        told = self.ends(self.ada.zo("xmp", "diff", "--json", "base.xmp", "more.xmp"), OK).objects
        self.assertEqual([(one["type"], one["change"], one["path"], one["old"], one["new"]) for one in told],
                         [("xmpDifference", "changed", "dc:format", "a", "b"),
                          ("xmpDifference", "added", "dc:rights", "", "[1 item]"),
                          ("xmpDifference", "removed", "dc:source", "a", "")])

    def test_what_is_no_packet_is_refused_with_its_place(self):
        self.write("broken.xmp", packet(format="a").replace(b"<dc:format>", b"\n  <dc:format x='>"))
        for words in (("merge", "base.xmp", "broken.xmp", "mine.xmp", "-o", "out.xmp"), ("diff", "base.xmp", "broken.xmp")):
            refused = self.ends(self.ada.zo("xmp", *words), FAILURE)
            self.assertEqual(refused.out, b"")
            self.assertRegex(refused.error_text, r"broken\.xmp, line 2, column \d+: ")
        self.assertFalse((self.ada.home / "out.xmp").exists())
        piped = self.ends(self.ada.zo("xmp", "diff", "base.xmp", "-", input=b""), FAILURE)
        self.assertIn("standard input", piped.error_text)
        self.ends(self.ada.zo("xmp", "diff", "base.xmp", "missing.xmp"), NOT_FOUND)

    def test_usage(self):
        for words in (("merge", "base.xmp", "mine.xmp"), ("merge", "base.xmp", "mine.xmp", "mine.xmp", "mine.xmp"),
                      ("diff", "base.xmp"), ("diff", "base.xmp", "mine.xmp", "-o", "out.xmp"), ("diff", "-", "-"),
                      ("merge", "base.xmp", "mine.xmp", "mine.xmp", "--dry-run"), ("mix", "base.xmp", "mine.xmp"),
                      ("get", "clip", "mine.xmp"), ("set", "clip", "mine.xmp", "mine.xmp"), ("merge",)):
            self.assertEqual(self.ends(self.ada.zo("xmp", *words), USAGE).out, b"", words)

    def test_an_output_that_cannot_be_written_is_no_success(self):
        files = [self.ada.home / name for name in ("base.xmp", "both.xmp", "other.xmp")]
        with open("/dev/full", "wb") as full:
            done = subprocess.run([ZO, "xmp", "merge", *files], stdout=full, stderr=subprocess.PIPE,
                                  env=self.ada.environment, timeout=PATIENCE, check=False)
        self.assertEqual(done.returncode, FAILURE, done.stderr)


if __name__ == "__main__":
    unittest.main()
