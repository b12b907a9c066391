"""Packets that an independent program has written are read, merged and written, and that program finds every
property in what came out."""
import json
import subprocess
import unittest

from harness import OK, PATIENCE, EndToEndTest

CONFLICTS = 3


def exiftool(*words):
    """Fails where the program is not there: without it nothing is shown."""
    done = subprocess.run(["exiftool", "-config", "", *map(str, words)], stdout=subprocess.PIPE, stderr=subprocess.PIPE,
                          timeout=PATIENCE, check=False)
    if done.returncode != 0:
        raise AssertionError(f"exiftool {words} ended with {done.returncode}: {done.stderr.decode()}")
    return done.stdout


def properties(path):
    """Every XMP property by its group and name, structures as such, values as they are stored."""
    (found,) = json.loads(exiftool("-j", "-struct", "-G1", "-a", "-n", "-XMP:all", path))
    # Who wrote the packet is no property of it.
    return {name: value for name, value in found.items() if name not in ("SourceFile", "XMP-x:XMPToolkit")}


BASE = [
    "-XMP-dc:Title=Harbour", "-XMP-dc:Title-de=Hafen", "-XMP-dc:Title-fr=Le port \u2014 \u00e9t\u00e9",
    "-XMP-dc:Creator=Ada", "-XMP-dc:Creator=Ben", "-XMP-dc:Subject=boat", "-XMP-dc:Subject=dawn",
    "-XMP-dc:Description=One line\nand \"another\" <with> & signs", "-XMP-dc:Rights=\u00a9 2024", "-XMP-dc:Format=video/mp4",
    "-XMP-xmp:CreateDate=2024:05:01 10:00:00+02:00", "-XMP-xmp:ModifyDate=2024:05:01 10:00:00+02:00",
    "-XMP-xmp:MetadataDate=2024:05:01 10:00:00+02:00", "-XMP-xmp:Rating=2", "-XMP-xmp:Label=Red",
    "-XMP-xmp:CreatorTool=Camera \u4e2d\u6587", "-XMP-xmpMM:DocumentID=xmp.did:1", "-XMP-xmpMM:InstanceID=xmp.iid:1",
    "-XMP-xmpMM:DerivedFrom={DocumentID=xmp.did:0,InstanceID=xmp.iid:0}",
    "-XMP-xmpMM:History={Action=created,When=2024:05:01 10:00:00+02:00,InstanceID=xmp.iid:1,SoftwareAgent=Camera}",
    "-XMP-xmpRights:UsageTerms=Ask", "-XMP-xmpRights:Marked=True", "-XMP-photoshop:City=Hamburg",
    "-XMP-iptcCore:CreatorContactInfo={CiAdrCity=Kiel,CiEmailWork=ada@example.com}",
    "-XMP-iptcExt:LocationShown=[{City=Kiel,Sublocation=Pier},{City=Hamburg}]",
    "-XMP-exif:GPSLatitude=53.55", "-XMP-exif:GPSLongitude=9.99", "-XMP-exif:ISO=200", "-XMP-tiff:Make=Maker",
    "-XMP-xmpDM:ShotName=1a", "-XMP-xmpDM:VideoFrameRate=25", "-XMP-xmpDM:Duration={Value=1000,Scale=1/25}",
    "-XMP-xmpDM:Tracks={TrackName=Comments,TrackType=Comment,FrameRate=f25,Markers=["
    "{StartTime=10,Duration=2,Comment=slate,CuePointParams=[{Key=marker_guid,Value=a}]},"
    "{StartTime=50,Comment=action,CuePointParams=[{Key=marker_guid,Value=b},{Key=colour,Value=red}]}]}",
]
THEIRS = [
    "-XMP-dc:Title-de=Der Hafen", "-XMP-dc:Subject+=crane", "-XMP-xmp:Rating=4", "-XMP-photoshop:City=",
    "-XMP-xmp:ModifyDate=2024:05:02 09:00:00Z", "-XMP-xmp:MetadataDate=2024:05:02 09:00:00Z",
    "-XMP-xmpMM:InstanceID=xmp.iid:2", "-XMP-xmpMM:History+={Action=saved,When=2024:05:02 09:00:00Z,InstanceID=xmp.iid:2}",
    "-XMP-xmpDM:Tracks={TrackName=Comments,TrackType=Comment,FrameRate=f25,Markers=["
    "{StartTime=12,Duration=2,Comment=slate,CuePointParams=[{Key=marker_guid,Value=a}]},"
    "{StartTime=50,Comment=action,CuePointParams=[{Key=marker_guid,Value=b},{Key=colour,Value=red}]},"
    "{StartTime=90,Comment=cut,CuePointParams=[{Key=marker_guid,Value=c}]}]}",
]
MINE = [
    "-XMP-dc:Title-fr=Le vieux port", "-XMP-dc:Subject+=gull", "-XMP-xmp:Label=Green", "-XMP-exif:ISO=400",
    "-XMP-xmp:ModifyDate=2024:05:02 08:00:00Z", "-XMP-xmp:MetadataDate=2024:05:03 08:00:00Z",
    "-XMP-xmpMM:InstanceID=xmp.iid:3", "-XMP-xmpMM:History+={Action=saved,When=2024:05:03 08:00:00Z,InstanceID=xmp.iid:3}",
    "-XMP-xmpDM:Tracks={TrackName=Comments,TrackType=Comment,FrameRate=f25,Markers=["
    "{StartTime=10,Duration=2,Comment=first slate,CuePointParams=[{Key=marker_guid,Value=a}]},"
    "{StartTime=20,Comment=gull,CuePointParams=[{Key=marker_guid,Value=d}]}]}",
]


class Exiftool(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.ada = self.user()
        self.base = self.ada.home / "base.xmp"
        exiftool(*BASE, self.base)
        self.theirs = self.changed("theirs.xmp", THEIRS)
        self.mine = self.changed("mine.xmp", MINE)

    def changed(self, name, changes):
        path = self.ada.home / name
        exiftool(*changes, "-o", path, self.base)
        return path

    def merged(self, base, theirs, mine, code=OK):
        path = self.ada.home / "merged.xmp"
        self.ends(self.ada.zo("xmp", "merge", base, theirs, mine, "-o", path, "--force"), code)
        return path

    def test_every_property_is_found_again(self):
        self.assertGreater(len(properties(self.base)), 28)
        for path in (self.base, self.theirs, self.mine):
            before = properties(path)
            after = properties(self.merged(path, path, path))
            self.assertEqual(sorted(before), sorted(after))
            self.assertEqual(before, after)
        # The comparison can fail.
        self.assertNotEqual(properties(self.theirs), properties(self.mine))

    def test_both_sides_are_found_in_what_was_merged(self):
        base, theirs, mine = map(properties, (self.base, self.theirs, self.mine))
        expected = {}
        both = set()
        for name in set(theirs) | set(mine):
            values = base.get(name), theirs.get(name), mine.get(name)
            if values[1] != values[0] and values[2] != values[0] and values[1] != values[2]:
                both.add(name)
            taken = values[2] if values[1] == values[0] else values[1]
            if taken is not None:
                expected[name] = taken
        self.assertEqual(both, {"XMP-dc:Subject", "XMP-xmp:ModifyDate", "XMP-xmp:MetadataDate", "XMP-xmpMM:InstanceID",
                                "XMP-xmpMM:History", "XMP-xmpDM:Tracks"})
        expected["XMP-dc:Subject"] = ["boat", "dawn", "crane", "gull"]
        expected["XMP-xmp:ModifyDate"] = theirs["XMP-xmp:ModifyDate"]
        expected["XMP-xmp:MetadataDate"] = mine["XMP-xmp:MetadataDate"]
        expected["XMP-xmpMM:InstanceID"] = "xmp.iid:3"
        expected["XMP-xmpMM:History"] = theirs["XMP-xmpMM:History"] + mine["XMP-xmpMM:History"][1:]
        (track,) = base["XMP-xmpDM:Tracks"]
        self.assertEqual(len(track["Markers"]), 2)
        theirs_markers = theirs["XMP-xmpDM:Tracks"][0]["Markers"]
        mine_markers = mine["XMP-xmpDM:Tracks"][0]["Markers"]
        # One marker has its time from them and its comment from me, one is removed by me, and each added one.
        slate = {**theirs_markers[0], "Comment": "first slate"}
        expected["XMP-xmpDM:Tracks"] = [{**track, "Markers": [slate, mine_markers[1], theirs_markers[2]]}]
        self.assertEqual(properties(self.merged(self.base, self.theirs, self.mine)), expected)
        self.assertNotIn("XMP-photoshop:City", expected)
        self.assertEqual(self.ada.zo("xmp", "diff", self.mine, self.mine).out, b"")

    def test_a_contradiction_keeps_mine(self):
        theirs = self.changed("theirs2.xmp", ["-XMP-dc:Format=video/quicktime", "-XMP-xmp:Rating=5"])
        mine = self.changed("mine2.xmp", ["-XMP-dc:Format=video/mxf", "-XMP-xmp:Label=Blue"])
        merged = properties(self.merged(self.base, theirs, mine, CONFLICTS))
        self.assertEqual(merged, {**properties(mine), "XMP-xmp:Rating": 5})


if __name__ == "__main__":
    unittest.main()
