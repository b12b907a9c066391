"""What the end-to-end tests share: zo and zohub as processes with directories of their own, and no waiting
but for events."""
import json
import os
import pathlib
import select
import shutil
import signal
import socket
import subprocess
import tempfile
import unittest

ZO = os.environ["ZO"]
ZOHUB = os.environ["ZOHUB"]
SOURCE = pathlib.Path(os.environ["ZO_SOURCE"])
MEDIA = SOURCE / "Tests" / "Media" / "sample-production"
PATIENCE = 120
"""Seconds after which something that hangs fails a test; nothing ever waits this long when all is well."""

OK, FAILURE, USAGE, BEHIND, CHANGED = 0, 1, 2, 4, 5
NOT_AUTHENTICATED, NOT_PERMITTED, NOT_FOUND, NETWORK, TLS, PARTLY, CANCELLED = 6, 7, 8, 9, 10, 11, 130


class Result:
    def __init__(self, code, out, err):
        self.code = code
        self.out = out
        self.err = err

    @property
    def text(self):
        return self.out.decode("utf-8", "replace")

    @property
    def error_text(self):
        return self.err.decode("utf-8", "replace")

    @property
    def objects(self):
        return [json.loads(line) for line in self.out.splitlines()]

    @property
    def object(self):
        (only,) = self.objects
        return only

    @property
    def errors(self):
        lines = [json.loads(line) for line in self.err.splitlines()]
        return [line for line in lines if line["type"] == "error"]

    def __str__(self):
        return f"exit code {self.code}\n--- out\n{self.text}\n--- err\n{self.error_text}"


def clean_environment(home):
    """The variables of a user whose home is a directory of the test."""
    keep = {name: value for name, value in os.environ.items()
            if not name.startswith(("ZOCLIENT_", "XDG_", "SSL_CERT_")) and "proxy" not in name.lower()
            and name not in ("NO_COLOR", "COLUMNS")}
    keep.update(HOME=str(home), ZOCLIENT_CONFIG_HOME=str(home / "config"), ZOCLIENT_CACHE_HOME=str(home / "cache"),
                ZOCLIENT_STATE_HOME=str(home / "state"), TERM="xterm-256color")
    return keep


class User:
    """Someone with a home of their own who runs zo."""

    def __init__(self, home):
        self.home = pathlib.Path(home)
        self.home.mkdir(parents=True, exist_ok=True)
        self.environment = clean_environment(self.home)
        self.said = []

    def zo(self, *words, input=b"", **variables):
        done = subprocess.run([ZO, *map(str, words)], input=input, stdout=subprocess.PIPE, stderr=subprocess.PIPE,
                              env={**self.environment, **variables}, cwd=self.home, timeout=PATIENCE, check=False)
        result = Result(done.returncode, done.stdout, done.stderr)
        self.said.append(result)
        return result

    def start(self, *words, **options):
        return subprocess.Popen([ZO, *map(str, words)], stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                                stderr=subprocess.PIPE, env=self.environment, cwd=self.home, **options)

    def password_file(self, password, name="password"):
        path = self.home / name
        path.write_text(password + "\n")
        path.chmod(0o600)
        return path


class Hub:
    """A zohub on free ports."""

    def __init__(self, directory, *options):
        self.directory = pathlib.Path(directory)
        self.directory.mkdir(parents=True, exist_ok=True)
        self.data = self.directory / "data"
        self.options = options
        self.process = None

    def command(self, *words):
        done = subprocess.run([ZOHUB, *map(str, words), "--data", str(self.data)], stdout=subprocess.PIPE,
                              stderr=subprocess.STDOUT, timeout=PATIENCE, check=False)
        if done.returncode != 0:
            raise AssertionError(f"zohub {words} ended with {done.returncode}: {done.stdout.decode()}")
        return done.stdout.decode()

    def add_user(self, name, password):
        path = self.directory / f"{name}.password"
        path.write_text(password + "\n")
        self.command("user", "add", name, "--password-cost", "10", "--password-file", path)

    def import_folder(self, folder, production, owner):
        return self.command("import", folder, "--production", production, "--owner", owner)

    def start(self):
        ready = self.directory / "ready.json"
        ready.unlink(missing_ok=True)
        self.log = open(self.directory / "hub.log", "ab")
        self.process = subprocess.Popen(
            [ZOHUB, "serve", "--data", str(self.data), "--port", "0", "--tls-port", "0", "--ready-file", str(ready),
             *map(str, self.options)], stdin=subprocess.DEVNULL, stdout=self.log, stderr=self.log)
        descriptor = os.pidfd_open(self.process.pid)
        ended = select.poll()
        ended.register(descriptor, select.POLLIN)
        while not ready.exists():
            if ended.poll(10):
                raise AssertionError("zohub ended: " + (self.directory / "hub.log").read_text())
        os.close(descriptor)
        said = json.loads(ready.read_text())
        self.url, self.tls_url, self.ca_file = said["httpUrl"], said["tlsUrl"], said["caFile"]
        return self

    def stop(self):
        if self.process:
            self.process.send_signal(signal.SIGTERM)
            self.process.wait(PATIENCE)
            self.process = None
            self.log.close()


class EndToEndTest(unittest.TestCase):
    maxDiff = None

    def setUp(self):
        self.root = pathlib.Path(tempfile.mkdtemp(prefix="zo-e2e."))
        self.addCleanup(shutil.rmtree, self.root, ignore_errors=True)

    def user(self, name="home"):
        return User(self.root / name)

    def hub(self, *options):
        hub = Hub(self.root / "hub", *options)
        self.addCleanup(hub.stop)
        return hub

    def ends(self, result, code):
        self.assertEqual(result.code, code, str(result))
        return result


def closed_port():
    """A port on which nobody listens: bound, never listened on, and kept until the test ends."""
    keeper = socket.socket()
    keeper.bind(("127.0.0.1", 0))
    return keeper, keeper.getsockname()[1]


def every_file(directory):
    return [path for path in pathlib.Path(directory).rglob("*") if path.is_file() and not path.is_symlink()]
