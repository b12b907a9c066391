#!/usr/bin/env python3
"""The same folder of media and sidecars in three systems on this machine, side by side in one run: put under
version control by one user, shared, fetched whole by a second user, and brought up to date after a change.

    compare.py BUILD_DIRECTORY [--files N]

Each system has its server as a process of its own on the loopback device, with its defaults: zohub, git daemon,
svnserve. git and svn come from the Debian packages git and subversion. Prints one line for each step, and a table in
the form of Docs/performance.md.
"""
import argparse
import json
import os
import pathlib
import random
import shutil
import signal
import socket
import subprocess
import sys
import tempfile
import time

WORDS = ("harbour gull lighthouse rope tide slate dawn engine boat wide close take scene sound light crew").split()
HEAD = ('<?xpacket begin="\ufeff" id="W5M0MpCehiHzreSzNTczkc9d"?>\n<x:xmpmeta xmlns:x="adobe:ns:meta/">\n'
        ' <rdf:RDF xmlns:rdf="http://www.w3.org/1999/02/22-rdf-syntax-ns#">\n'
        '  <rdf:Description rdf:about="" xmlns:dc="http://purl.org/dc/elements/1.1/">\n   <dc:subject><rdf:Bag>\n')
TAIL = ('   </rdf:Bag></dc:subject>\n  </rdf:Description>\n </rdf:RDF>\n</x:xmpmeta>\n<?xpacket end="w"?>')
SIDECAR_BYTES = 4096
CHANGED_PART = 10
"""One file in so many is changed for the update."""


def sidecar(seed):
    rng = random.Random(seed)
    text = HEAD
    while len(text.encode()) + len(TAIL) + 64 < SIDECAR_BYTES:
        text += f"    <rdf:li>{rng.choice(WORDS)} {rng.choice(WORDS)} {rng.randrange(10**6)}</rdf:li>\n"
    return (text + " " * (SIDECAR_BYTES - len(text.encode()) - len(TAIL)) + TAIL).encode()


def make_folder(root, files):
    for number in range(files):
        folder = root / f"day{number % 20:02}"
        folder.mkdir(parents=True, exist_ok=True)
        (folder / f"clip{number:05}.mov").write_bytes(b"media %d" % number)
        (folder / f"clip{number:05}.xmp").write_bytes(sidecar(number))


def change(root):
    for path in sorted(root.rglob("*.xmp"))[::CHANGED_PART]:
        path.write_bytes(sidecar(path.name + " changed"))


def run(*words, cwd=None, env=None, stdin=None):
    done = subprocess.run([str(word) for word in words], cwd=cwd, env=env, input=stdin, stdout=subprocess.PIPE,
                          stderr=subprocess.PIPE, check=False)
    if done.returncode != 0:
        sys.exit(f"compare: {' '.join(map(str, words))} ended with {done.returncode}:\n{done.stderr.decode()[-2000:]}")
    return done.stdout


def free_port():
    with socket.create_server(("127.0.0.1", 0)) as server:
        return server.getsockname()[1]


def wait_for_port(port, process):
    while True:
        with socket.socket() as probe:
            if probe.connect_ex(("127.0.0.1", port)) == 0:
                return
        if process.poll() is not None:
            sys.exit("compare: a server ended at its start")


class System:
    """One system with its server; each step is one method. All files lie below `work`."""

    def __init__(self, work):
        self.work = work
        work.mkdir()
        self.process = None

    def start(self, *words, port=None, **options):
        self.process = subprocess.Popen([str(word) for word in words], stdin=subprocess.DEVNULL,
                                        stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL, start_new_session=True,
                                        **options)
        if port:
            wait_for_port(port, self.process)

    def stop(self):
        if self.process:
            # The group that was started here: git daemon has children.
            os.killpg(self.process.pid, signal.SIGTERM)
            self.process.wait()


class Zo(System):
    name = "zo and zohub"

    def __init__(self, work, build):
        super().__init__(work)
        self.zo = build / "bin" / "zo"
        zohub = build / "bin" / "zohub"
        data = work / "hub"
        (work / "empty").mkdir()
        for user in ("anna", "ben"):
            self.write_private(work / f"{user}.password", f"secret of {user}\n")
            run(zohub, "user", "add", user, "--data", data, "--password-file", work / f"{user}.password")
        run(zohub, "import", work / "empty", "--data", data, "--production", "Film", "--owner", "anna", "--grant", "ben")
        ready = work / "ready.json"
        self.start(zohub, "serve", "--data", data, "--port", "0", "--no-tls", "--ready-file", ready)
        while not ready.exists():
            if self.process.poll() is not None:
                sys.exit("compare: zohub ended at its start")
        url = json.loads(ready.read_text())["httpUrl"]
        for user in ("anna", "ben"):
            self.run_zo(user, "login", "--server", url, "--user", user, "--password-file", work / f"{user}.password")
            self.run_zo(user, "open", "Film")

    @staticmethod
    def write_private(path, text):
        path.touch(mode=0o600)
        path.write_text(text)

    def run_zo(self, user, *words):
        homes = {f"ZOCLIENT_{kind}_HOME": str(self.work / user / kind.lower()) for kind in ("CONFIG", "STATE", "CACHE")}
        return run(self.zo, *words, "--quiet", env={**os.environ, **homes, "NO_PROXY": "127.0.0.1"}, cwd=self.work)

    def commit(self, folder):
        self.folder = folder
        self.run_zo("anna", "ingest", folder, "-m", "all")

    def share(self):
        self.run_zo("anna", "share", "-m", "all")

    def fetch(self):
        self.run_zo("ben", "latest")
        self.run_zo("ben", "get", "--all", "-o", str(self.work / "ben-files") + "/")
        return len(list((self.work / "ben-files").rglob("*.xmp")))

    def commit_change(self):
        self.run_zo("anna", "ingest", self.folder, "--update", "-m", "changed")

    def update(self):
        self.run_zo("ben", "latest")
        self.run_zo("ben", "get", "--all", "--force", "-o", str(self.work / "ben-files") + "/")

    def changed_file(self, relative):
        return self.work / "ben-files" / relative.with_suffix(".mov.xmp")


class Git(System):
    name = "git and git daemon"

    def __init__(self, work):
        super().__init__(work)
        run("git", "init", "--bare", "-q", "-b", "main", work / "served" / "film.git")
        port = free_port()
        self.url = f"git://127.0.0.1:{port}/film.git"
        self.start("git", "daemon", "--reuseaddr", "--export-all", "--enable=receive-pack", "--listen=127.0.0.1",
                   f"--port={port}", f"--base-path={work / 'served'}", work / "served", port=port)

    def run_git(self, *words, cwd):
        who = ["-c", "user.name=bench", "-c", "user.email=bench@localhost.invalid", "-c", "gc.auto=0"]
        return run("git", *who, *words, cwd=cwd)

    def commit(self, folder):
        self.folder = folder
        self.run_git("init", "-q", "-b", "main", cwd=folder)
        self.run_git("add", ".", cwd=folder)
        self.run_git("commit", "-q", "-m", "all", cwd=folder)
        self.run_git("remote", "add", "origin", self.url, cwd=folder)

    def share(self):
        self.run_git("push", "-q", "origin", "main", cwd=self.folder)

    def fetch(self):
        self.run_git("clone", "-q", self.url, "ben", cwd=self.work)
        return len(list((self.work / "ben").rglob("*.xmp")))

    def commit_change(self):
        self.run_git("commit", "-q", "-a", "-m", "changed", cwd=self.folder)

    def update(self):
        self.run_git("pull", "-q", cwd=self.work / "ben")

    def changed_file(self, relative):
        return self.work / "ben" / relative.with_suffix(".xmp")


class Subversion(System):
    name = "Subversion and svnserve"

    def __init__(self, work):
        super().__init__(work)
        run("svnadmin", "create", work / "served")
        (work / "served" / "conf" / "svnserve.conf").write_text("[general]\nanon-access = write\n")
        port = free_port()
        self.url = f"svn://127.0.0.1:{port}/served"
        self.start("svnserve", "--daemon", "--foreground", "--root", work, "--listen-host", "127.0.0.1",
                   "--listen-port", str(port), port=port)

    def run_svn(self, *words, cwd):
        return run("svn", *words, "--quiet", "--non-interactive", "--config-dir", self.work / "config", cwd=cwd)

    # A commit of Subversion is shared at once.
    def commit(self, folder):
        self.folder = folder
        self.run_svn("checkout", self.url, ".", cwd=folder)
        self.run_svn("add", "--force", ".", cwd=folder)
        self.run_svn("commit", "-m", "all", cwd=folder)

    def share(self):
        return None

    def fetch(self):
        self.run_svn("checkout", self.url, "ben", cwd=self.work)
        return len(list((self.work / "ben").rglob("*.xmp")))

    def commit_change(self):
        self.run_svn("commit", "-m", "changed", cwd=self.folder)

    def update(self):
        self.run_svn("update", "ben", cwd=self.work)

    def changed_file(self, relative):
        return self.work / "ben" / relative.with_suffix(".xmp")


def timed(function, *arguments):
    began = time.monotonic()
    result = function(*arguments)
    return time.monotonic() - began, result


def measure(system, folder, files):
    figures = {}
    figures["commit"], _ = timed(system.commit, folder)
    figures["share"], _ = timed(system.share)
    figures["fetch by a second user"], fetched = timed(system.fetch)
    if fetched != files:
        sys.exit(f"compare: {system.name}: {fetched} of {files} sidecars arrived")
    change(folder)
    figures["commit a tenth changed"], _ = timed(system.commit_change)
    figures["share it"], _ = timed(system.share)
    figures["update of the second user"], _ = timed(system.update)
    changed = sorted(path.relative_to(folder) for path in folder.rglob("*.xmp"))[0]
    if system.changed_file(changed).read_bytes() != (folder / changed).read_bytes():
        sys.exit(f"compare: {system.name}: the change did not arrive")
    for step, seconds in figures.items():
        print(f"compare {system.name}: {step}: {seconds:.2f} s", flush=True)
    return figures


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("build", type=lambda text: pathlib.Path(text).resolve())
    parser.add_argument("--files", type=int, default=10000)
    arguments = parser.parse_args()
    for program in ("git", "svn", "svnadmin", "svnserve"):
        if not shutil.which(program):
            sys.exit(f"compare: {program} is missing; install the Debian packages git and subversion")
    columns = {}
    with tempfile.TemporaryDirectory(prefix="zo-compare.") as root:
        root = pathlib.Path(root)
        makers = [lambda work: Zo(work, arguments.build), Git, Subversion]
        for number, maker in enumerate(makers):
            # A folder for each, named alike: git and Subversion keep their own things in it.
            folder = root / f"folder{number}" / "film"
            make_folder(folder, arguments.files)
            system = maker(root / f"system{number}")
            try:
                columns[system.name] = measure(system, folder, arguments.files)
            finally:
                system.stop()
    steps = next(iter(columns.values()))
    print(f"\n| {arguments.files:,} media files with a sidecar of 4 KiB each | " + " | ".join(columns) + " |")
    print("|---" * (len(columns) + 1) + "|")
    for step in steps:
        print(f"| {step} | " + " | ".join(f"{figures[step]:.1f} s" for figures in columns.values()) + " |")


if __name__ == "__main__":
    main()
