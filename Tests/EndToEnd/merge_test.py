"""Two users edit the metadata of the same clips, share, and get the latest: nobody is asked, unless they contradict
one another."""
import unittest

from harness import OK
from team_test import CONFLICTS, Team, of_type

HEAD = ('<x:xmpmeta xmlns:x="adobe:ns:meta/"><rdf:RDF xmlns:rdf="http://www.w3.org/1999/02/22-rdf-syntax-ns#">'
        '<rdf:Description rdf:about="" xmlns:xmp="http://ns.adobe.com/xap/1.0/" '
        'xmlns:xmpMM="http://ns.adobe.com/xap/1.0/mm/" xmlns:dc="http://purl.org/dc/elements/1.1/" '
        'xmlns:xmpDM="http://ns.adobe.com/xmp/1.0/DynamicMedia/" '
        'xmlns:stEvt="http://ns.adobe.com/xap/1.0/sType/ResourceEvent#">')
TAIL = "</rdf:Description></rdf:RDF></x:xmpmeta>"
CLIPS = ("gulls.jpg", "lighthouse.jpg", "anna-take1.mp4", "harbour-wide.mp4")


def marker(guid, start, comment):
    return (f'<rdf:li rdf:parseType="Resource"><xmpDM:startTime>{start}</xmpDM:startTime><xmpDM:comment>{comment}'
            "</xmpDM:comment><xmpDM:cuePointParams><rdf:Seq><rdf:li xmpDM:key='marker_guid' "
            f"xmpDM:value='{guid}'/></rdf:Seq></xmpDM:cuePointParams></rdf:li>")


def event(action, when):
    return (f'<rdf:li rdf:parseType="Resource"><stEvt:action>{action}</stEvt:action><stEvt:when>{when}</stEvt:when>'
            "</rdf:li>")


def packet(date, events, markers, more=""):
    """A packet as a host leaves it: dates, instance, history, markers."""
    return (HEAD + f"<xmp:ModifyDate>{date}</xmp:ModifyDate><xmp:MetadataDate>{date}</xmp:MetadataDate>"
            f"<xmpMM:InstanceID>xmp.iid:{date}</xmpMM:InstanceID><xmpMM:History><rdf:Seq>{''.join(events)}"
            "</rdf:Seq></xmpMM:History><xmpDM:Tracks><rdf:Bag><rdf:li rdf:parseType='Resource'><xmpDM:trackName>Comments"
            f"</xmpDM:trackName><xmpDM:markers><rdf:Seq>{''.join(markers)}</rdf:Seq></xmpDM:markers></rdf:li></rdf:Bag>"
            "</xmpDM:Tracks>" + more + TAIL).encode()


MADE = event("created", "2024-05-01T08:00:00Z")
SLATE = marker("a", 1, "slate")
BASE = packet("2024-05-01T08:00:00Z", [MADE], [SLATE])
ADA = packet("2024-05-01T09:00:00Z", [MADE, event("ada", "2024-05-01T09:00:00Z")], [SLATE, marker("b", 5, "from Ada")],
             "<dc:creator><rdf:Seq><rdf:li>Ada</rdf:li></rdf:Seq></dc:creator>")
BEN = packet("2024-05-01T10:00:00Z", [MADE, event("ben", "2024-05-01T10:00:00Z")],
             [marker("a", 2, "slate"), marker("c", 7, "from Ben")], "<dc:format>video/mp4</dc:format>")
BOTH = packet("2024-05-01T10:00:00Z",
              [MADE, event("ada", "2024-05-01T09:00:00Z"), event("ben", "2024-05-01T10:00:00Z")],
              [marker("a", 2, "slate"), marker("c", 7, "from Ben"), marker("b", 5, "from Ada")],
              "<dc:creator><rdf:Seq><rdf:li>Ada</rdf:li></rdf:Seq></dc:creator><dc:format>video/mp4</dc:format>")


class Merge(Team):
    def setUp(self):
        super().setUp()
        self.set_all(self.ada, BASE)
        self.share(self.ada)
        self.get_latest(self.ben)

    def set_all(self, user, content, clips=CLIPS):
        path = self.file(user, "set.xmp", content)
        for clip in clips:
            self.ok(user, "xmp", "set", clip, path)

    def same(self, user, clip, expected):
        self.ends(user.zo("xmp", "get", clip, "-o", "got.xmp", "--force"), OK)
        self.file(user, "expected.xmp", expected)
        self.assertEqual(self.ends(user.zo("xmp", "diff", "expected.xmp", "got.xmp"), OK).text, "", clip)

    def test_both_edits_are_there_and_nobody_was_asked(self):
        self.set_all(self.ada, ADA)
        self.share(self.ada)
        self.set_all(self.ben, BEN)
        got = of_type(self.ok(self.ben, "latest"), "latest")[0]
        self.assertEqual((got["conflicts"], got["merged"]), (0, len(CLIPS)))
        self.assertEqual(self.ok(self.ben, "conflicts").objects, [])
        for clip in CLIPS:
            self.same(self.ben, clip, BOTH)
        newest = self.ok(self.ben, "history", "--count", "1").object
        self.assertEqual((newest["message"], newest["transactionType"]), ("Automatically resolved XMP conflicts.", "edit"))
        self.assertEqual(newest["commit"], got["commit"])
        self.assertEqual(self.ok(self.ben, "pending").objects, [])
        self.share(self.ben)
        self.get_latest(self.ada)
        for clip in CLIPS:
            self.same(self.ada, clip, BOTH)

    def test_a_contradiction_is_left_to_the_user_and_the_others_merge(self):
        self.set_all(self.ada, ADA)
        self.set_all(self.ada, ADA.replace(b"</rdf:Description></rdf:RDF>",
                                           b"<dc:format>video/mxf</dc:format></rdf:Description></rdf:RDF>"), CLIPS[:1])
        self.share(self.ada)
        self.set_all(self.ben, BEN)
        pulled = self.ends(self.ben.zo("latest", "--json"), CONFLICTS)
        got = of_type(pulled, "latest")[0]
        self.assertEqual((got["conflicts"], got["merged"]), (1, len(CLIPS) - 1))
        self.assertEqual([one["asset"] for one in of_type(pulled, "conflict")], [CLIPS[0]])
        self.same(self.ben, CLIPS[0], BEN)
        for clip in CLIPS[1:]:
            self.same(self.ben, clip, BOTH)
        self.ok(self.ben, "resolve", "--mine", CLIPS[0])
        self.share(self.ben)

    def test_what_comes_out_as_one_side_has_it_is_no_conflict_either(self):
        # Ben's is later in everything that both have changed, and written as the library writes it.
        self.set_all(self.ada, BASE.replace(b"2024-05-01T08:00:00Z</xmp:ModifyDate>",
                                            b"2024-05-01T08:30:00Z</xmp:ModifyDate>"))
        self.share(self.ada)
        self.file(self.ben, "ben.xmp", BEN)
        self.ends(self.ben.zo("xmp", "merge", "ben.xmp", "ben.xmp", "ben.xmp", "-o", "own.xmp"), OK)
        own = (self.ben.home / "own.xmp").read_bytes()
        self.set_all(self.ben, own)
        got = of_type(self.ok(self.ben, "latest"), "latest")[0]
        self.assertEqual((got["conflicts"], got["merged"]), (0, len(CLIPS)))
        for clip in CLIPS:
            self.same(self.ben, clip, BEN)
        self.share(self.ben)


if __name__ == "__main__":
    unittest.main()
