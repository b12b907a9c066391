"""zo before a person: a pseudo-terminal, its echo, its width, and Ctrl-C typed into it."""
import fcntl
import os
import pty
import select
import struct
import subprocess
import termios
import unicodedata
import unittest

from fake_hub import FakeHub
from harness import CANCELLED, OK, PATIENCE, USAGE, ZO, EndToEndTest


class Terminal:
    """A process with a terminal of its own."""

    def __init__(self, user, *words, columns=80, **variables):
        self.master, slave = pty.openpty()
        fcntl.ioctl(slave, termios.TIOCSWINSZ, struct.pack("HHHH", 24, columns, 0, 0))

        def take_terminal():
            os.setsid()
            fcntl.ioctl(0, termios.TIOCSCTTY, 0)

        self.process = subprocess.Popen([ZO, *map(str, words)], stdin=slave, stdout=slave, stderr=slave,
                                        env={**user.environment, **variables}, cwd=user.home,
                                        preexec_fn=take_terminal)
        os.close(slave)
        self.said = b""

    def read(self):
        """What is said next; empty at the end."""
        ready, _, _ = select.select([self.master], [], [], PATIENCE)
        if not ready:
            raise AssertionError("nothing came: " + repr(self.said))
        try:
            piece = os.read(self.master, 65536)
        except OSError:
            piece = b""
        self.said += piece
        return piece

    def wait_for(self, text):
        while text not in self.said:
            if not self.read():
                raise AssertionError(f"{text!r} was never said: {self.said!r}")

    def type(self, text):
        os.write(self.master, text)

    def echoes(self):
        return bool(termios.tcgetattr(self.master)[3] & termios.ECHO)

    def end(self):
        while self.read():
            pass
        code = self.process.wait(PATIENCE)
        os.close(self.master)
        return code


def width(text):
    return sum(0 if unicodedata.combining(one) else 2 if unicodedata.east_asian_width(one) in "WF" else 1
               for one in text)


class BeforeAPerson(EndToEndTest):
    def setUp(self):
        super().setUp()
        names = ["clip", "海辺の映画 第一部 とても長い名前のクリップ その一 その二 その三 その四",
                 "a-very-long-name-" * 10, "e\u0301te\u0301", "서울의 봄"]
        self.hub = FakeHub(names=names)
        self.addCleanup(self.hub.close)
        self.ada = self.user()

    def login_by_prompt(self, *extra):
        terminal = Terminal(self.ada, "login", "--server", self.hub.url, "--user", "ada", *extra)
        terminal.wait_for(b"Password of ada")
        return terminal

    def test_the_password_is_asked_for_without_echo(self):
        terminal = self.login_by_prompt()
        self.assertFalse(terminal.echoes())
        terminal.type(b"typed-secret\n")
        self.assertEqual(terminal.end(), OK, terminal.said)
        self.assertNotIn(b"typed-secret", terminal.said)
        self.assertIn(b"signed in", terminal.said)

    def test_ctrl_c_at_the_prompt_puts_the_terminal_right(self):
        terminal = self.login_by_prompt()
        terminal.type(b"half\x03")
        terminal.process.wait(PATIENCE)
        self.assertTrue(terminal.echoes())
        self.assertEqual(terminal.end(), CANCELLED)
        self.assertNotIn(b"half", terminal.said)

    def test_nothing_is_asked_off_a_terminal(self):
        result = self.ends(self.ada.zo("login", "--server", self.hub.url, "--user", "ada", input=b"secret\n"), USAGE)
        self.assertIn("--password-file", result.error_text)
        self.assertNotIn("Password of", result.error_text)

    def test_tables_fit_the_terminal(self):
        self.ends(self.ada.zo("login", "--server", self.hub.url, "--user", "ada", "--password-stdin", input=b"x\n"), OK)
        self.ends(self.ada.zo("open", "Fake"), OK)
        for columns in (80, 120):
            for words in (("assets",), ("assets", "--long"), ("productions",)):
                terminal = Terminal(self.ada, *words, "--color", "never", columns=columns)
                self.assertEqual(terminal.end(), OK, terminal.said)
                lines = terminal.said.decode().replace("\r\n", "\n").splitlines()
                for line in lines:
                    self.assertLessEqual(width(line), columns, line)
                if words == ("assets",):
                    # Cut, not dropped; and the second column begins at one place in every line.
                    self.assertEqual(len(lines), 6)
                    starts = {width(line[:line.index("masterclip")]) for line in lines[1:]}
                    self.assertEqual(len(starts), 1)
                    self.assertIn("\u2026", terminal.said.decode())

    def test_colour_only_where_it_is_wanted(self):
        self.ends(self.ada.zo("login", "--server", self.hub.url, "--user", "ada", "--password-stdin", input=b"x\n"), OK)
        for variables, words, painted in (({}, (), True), ({"NO_COLOR": "1"}, (), False),
                                          ({"NO_COLOR": "1"}, ("--color", "always"), True),
                                          ({}, ("--color", "never"), False), ({}, ("--json",), False)):
            terminal = Terminal(self.ada, "productions", *words, **variables)
            self.assertEqual(terminal.end(), OK)
            self.assertEqual(b"\x1b[1m" in terminal.said, painted, (variables, words))
        self.assertNotIn("\x1b", self.ada.zo("productions").text)

    def test_a_bar_on_a_terminal_and_lines_off_it(self):
        self.ends(self.ada.zo("login", "--server", self.hub.url, "--user", "ada", "--password-stdin", input=b"x\n"), OK)
        self.ends(self.ada.zo("open", "Fake"), OK)
        terminal = Terminal(self.ada, "get", "--all", "-o", "one/")
        self.assertEqual(terminal.end(), OK)
        self.assertIn(b"\r\x1b[K[", terminal.said)
        off = self.ends(self.ada.zo("get", "--all", "-o", "two/"), OK)
        self.assertIn("5/5", off.error_text)
        self.assertNotIn("\x1b", off.error_text)
        quiet = self.ends(self.ada.zo("get", "--all", "-o", "three/", "--quiet"), OK)
        self.assertEqual((quiet.out, quiet.err), (b"", b""))


if __name__ == "__main__":
    unittest.main()
