"""Help, manual pages and completions say what the table of verbs says."""
import os
import pathlib
import subprocess
import unittest

from harness import OK, PATIENCE, USAGE, EndToEndTest

COMMON = ("json", "quiet", "color", "help")


class Documents(EndToEndTest):
    def setUp(self):
        super().setUp()
        self.ada = self.user()
        self.table = self.ends(self.ada.zo("help", "--json"), OK).objects

    def test_every_verb_is_there_with_help_examples_and_exit_codes(self):
        self.assertEqual([verb["name"] for verb in self.table],
                         ["hub", "login", "logout", "whoami", "productions", "open", "show", "assets", "get", "session",
                          "status", "add", "ingest", "set", "put", "rm", "xmp", "commit", "rollback", "pending", "share", "latest",
                          "conflicts", "resolve", "diff", "history", "watch", "desk", "help", "version", "completion", "man"])
        overview = self.ends(self.ada.zo("help"), OK).text
        for verb in self.table:
            self.assertIn("\n  " + verb["name"], overview)
            for asked in (("help", verb["name"]), (verb["name"], "--help")):
                text = self.ends(self.ada.zo(*asked), OK).text
                self.assertIn("Examples:", text)
                for option in verb["options"]:
                    self.assertIn("--" + option["name"], text)
                for code in verb["exitCodes"]:
                    self.assertRegex(text, rf"(?m)^  {code} ")
                self.assertLessEqual(max(map(len, text.splitlines())), 100)
        self.ends(self.ada.zo("help", "nothing"), USAGE)

    def test_manual_pages(self):
        for verb in self.table:
            page = self.ends(self.ada.zo("man", verb["name"]), OK).text
            self.assertTrue(page.startswith('.TH "zo\\-' + verb["name"]), page[:60])
            for option in verb["options"]:
                self.assertIn("\\-\\-" + option["name"].replace("-", "\\-"), page)
            for section in ("NAME", "SYNOPSIS", "DESCRIPTION", "EXIT STATUS", "EXAMPLES"):
                self.assertIn("\n.SH " + section, page)
        self.assertIn("NO_COLOR", self.ends(self.ada.zo("man"), OK).text)

    def test_the_documents_of_the_build_are_those_of_the_program(self):
        share = pathlib.Path(os.environ["ZO_SHARE"])
        self.assertEqual((share / "man/man1/zo.1").read_text(), self.ada.zo("man").text)
        for verb in self.table:
            self.assertEqual((share / f"man/man1/zo-{verb['name']}.1").read_text(), self.ada.zo("man", verb["name"]).text)
        for shell, name in (("bash", "bash-completion/completions/zo"), ("zsh", "zsh/site-functions/_zo"),
                            ("fish", "fish/vendor_completions.d/zo.fish")):
            self.assertEqual((share / name).read_text(), self.ends(self.ada.zo("completion", shell), OK).text)

    def complete(self, *words):
        script = self.ada.home / "completion.bash"
        script.write_text(self.ada.zo("completion", "bash").text)
        asked = ('source "$1"; shift; COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1)); COMPREPLY=(); _zo; '
                 'printf "%s\\n" "${COMPREPLY[@]}"')
        done = subprocess.run(["bash", "--norc", "-c", asked, "bash", str(script), *words], stdout=subprocess.PIPE,
                              stderr=subprocess.PIPE, cwd=self.ada.home, timeout=PATIENCE, check=False)
        self.assertEqual(done.stderr, b"")
        return done.stdout.decode().split()

    def test_completion_in_a_real_shell(self):
        self.assertEqual(self.complete("zo", ""), [verb["name"] for verb in self.table])
        self.assertEqual(self.complete("zo", "pro"), ["productions"])
        for verb in self.table:
            offered = self.complete("zo", verb["name"], "--")
            self.assertEqual(offered, ["--" + option["name"] for option in verb["options"]])
        self.assertEqual(self.complete("zo", "hub", "s"), ["start", "stop", "status"])
        self.assertEqual(self.complete("zo", "get", "--rendition", "image/"), ["image/jpeg", "image/png"])
        self.assertEqual(self.complete("zo", "help", "who"), ["whoami"])
        (self.ada.home / "clip.pem").write_text("")
        self.assertEqual(self.complete("zo", "login", "--ca", "cl"), ["clip.pem"])

    def test_the_other_shells_name_every_verb_and_option(self):
        zsh = self.ada.zo("completion", "zsh").text
        fish = self.ada.zo("completion", "fish").text
        for verb in self.table:
            self.assertIn(f"\n    {verb['name']})", zsh)
            self.assertIn(f"-a {verb['name']} ", fish)
            for option in verb["options"]:
                self.assertIn("'--" + option["name"], zsh)
                self.assertIn(f"from {verb['name']}' -l {option['name']}", fish)

    def test_the_reference_names_every_verb_option_and_json_type(self):
        reference = (pathlib.Path(os.environ["ZO_SOURCE"]) / "Docs" / "zo.md").read_text()
        for verb in self.table:
            self.assertIn(f"### zo {verb['name']}", reference)
            for option in verb["options"]:
                self.assertIn("`--" + option["name"], reference)
        for kind in ("hub", "login", "logout", "user", "production", "open", "asset", "file", "command", "version",
                     "completion", "man", "error", "progress", "session", "status", "added", "ingested", "ingest", "set", "put", "removed", "xmp",
                     "transaction", "pending", "share", "latest", "conflict", "difference", "change", "xmpMerge", "xmpDifference"):
            self.assertIn(f"`{kind}`", reference)


if __name__ == "__main__":
    unittest.main()
