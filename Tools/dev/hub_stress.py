#!/usr/bin/env python3
"""Many users at one hub, which is killed under them; afterwards nothing that was answered may be missing.

  hub_stress.py BUILD_DIR [--clients 20] [--seconds 60] [--kills 0] [--seed N]

Starts a zohub of its own on a loopback port and in a directory of its own. Each client has a session on one
shared production and at random edits it in transactions, shares, gets the latest changes, answers conflicts and
rolls back. With --kills the hub is ended by SIGKILL that many times at random moments and started again. Each
client notes what was answered. A request that was not answered is either repeated with its Idempotency-Key or
left open. At the end all must be there: `zohub check` finds nothing; each answered share is in the history once,
with the commit that was answered, and each unanswered one at most once; every answered change is in its session
and, once shared, in the production; no change of anybody's was lost to somebody else's; payloads are whole.

The changes that clash are ledgers: assets whose description is a list of marks, to which everybody appends.
Whoever resolves such a conflict writes both lists, or withdraws his own marks, so no mark may go missing.

--seed makes the same choices again; what happens at the same time still varies.
"""
import argparse
import http.client
import json
import pathlib
import random
import subprocess
import sys
import tempfile
import threading
import time
import urllib.parse

RELATIONS = "http://ns.meridane.example/zo/rel"
LEDGERS = 12
PAYLOAD = 20000
PATIENCE = 60  # seconds for the hub to come back


class Unanswered(Exception):
    """The request went out, and whether it was done is not known."""


class Violation(Exception):
    pass


class HubProcess:
    """The hub as a child of this process; after a kill it listens on the same port again."""

    def __init__(self, binary, directory):
        self.binary, self.directory, self.port, self.process = binary, directory, 0, None
        self.data = directory / "data"

    def run(self, *words, **options):
        return subprocess.run([self.binary, *words, "--data", self.data], text=True, capture_output=True,
                              timeout=PATIENCE, **options)

    def start(self):
        ready = self.directory / "ready.json"
        ready.unlink(missing_ok=True)
        log = (self.directory / "hub.log").open("a")
        words = ["serve", "--data", self.data, "--port", str(self.port), "--no-tls", "--ready-file", ready]
        self.process = subprocess.Popen([self.binary, *words], stdout=log, stderr=log)
        log.close()
        end = time.monotonic() + PATIENCE
        while not ready.exists():
            if self.process.poll() is not None or time.monotonic() > end:
                raise SystemExit(f"hub_stress: the hub did not start; see {self.directory / 'hub.log'}")
            time.sleep(0.01)
        self.port = urllib.parse.urlsplit(json.loads(ready.read_text())["httpUrl"]).port

    def kill(self):
        self.process.kill()
        self.process.wait()

    def stop(self):
        if self.process and self.process.poll() is None:
            self.process.terminate()
            self.process.wait(timeout=PATIENCE)


def link(document, relation):
    full = RELATIONS + relation if relation.startswith("/") else relation
    for entry in document["links"]:
        if entry["rel"] == full:
            return entry["href"]
    raise Violation(f"no link {relation} in {json.dumps(document)[:300]}")


def form(fields):
    parts = "".join(f'--b7x\r\nContent-Disposition: form-data; name="{name}"\r\n\r\n{value}\r\n'
                    for name, value in fields)
    return parts + "--b7x--\r\n", "multipart/form-data; boundary=b7x"


class Wire:
    """One user's connection. Counts what became of the requests."""

    def __init__(self, hub, name):
        self.hub, self.name, self.cookie, self.connection = hub, name, "", None
        self.answered = self.unanswered = 0

    def connect(self):
        end = time.monotonic() + PATIENCE
        while True:
            try:
                self.connection = http.client.HTTPConnection("127.0.0.1", self.hub.port, timeout=PATIENCE)
                self.connection.connect()
                return
            except OSError:
                if time.monotonic() > end:
                    raise Violation("the hub did not come back") from None
                time.sleep(0.02)

    def exchange(self, method, target, body, headers):
        if not self.connection:
            self.connect()
        try:
            self.connection.request(method, target, body, headers)
            answer = self.connection.getresponse()
            payload = answer.read()
        except (OSError, http.client.HTTPException) as error:
            self.connection.close()
            self.connection = None
            raise Unanswered(str(error)) from error
        if answer.will_close:
            self.connection.close()
            self.connection = None
        return answer, payload

    def send(self, method, href, body=None, kind=None, key=None, repeats=False):
        """Status and body. Reads are repeated until they are answered; so are others when told to."""
        parts = urllib.parse.urlsplit(href)
        target = parts.path + ("?" + parts.query if parts.query else "")
        headers = {"Cookie": self.cookie}
        if kind:
            headers["Content-Type"] = kind
        if key:
            headers["Idempotency-Key"] = key
        while True:
            try:
                answer, payload = self.exchange(method, target, body.encode() if body is not None else None, headers)
            except Unanswered:
                self.unanswered += 1
                if method == "GET" or repeats:
                    continue
                raise
            self.answered += 1
            if answer.status == 503:
                time.sleep(0.1)
                continue
            if answer.status >= 500:
                raise Violation(f"{method} {target}: {answer.status} {payload[:300]!r}")
            if method == "POST" and "login-token" in (answer.getheader("Set-Cookie") or ""):
                self.cookie = answer.getheader("Set-Cookie").split(";")[0]
            return answer.status, payload

    def get(self, href):
        status, payload = self.send("GET", href)
        if status != 200:
            raise Violation(f"GET {href}: {status} {payload[:300]!r}")
        return json.loads(payload)

    def login(self):
        status, _ = self.send("POST", f"http://127.0.0.1:{self.hub.port}/zo/1/system/login",
                              f"j_username={self.name}&j_password=secret-{self.name}",
                              "application/x-www-form-urlencoded", repeats=True)
        if status != 200:
            raise Violation(f"{self.name} cannot sign in: {status}")
        service = self.get(f"http://127.0.0.1:{self.hub.port}/content/zo/api/discovery.json")
        return self.get(link(service, "/discovery/v1"))


class Client(threading.Thread):
    def __init__(self, hub, name, seed, production):
        super().__init__(name=name)
        self.wire, self.random = Wire(hub, name), random.Random(f"{seed}:{name}")
        self.production_href, self.serial, self.end = production, 0, 0.0
        self.session_href = ""
        self.marks = {}    # mark -> [ledger, state]: "sure", "open", "withdrawn"
        self.assets = {}   # identifier -> state: "sure", "open", "removed", "removing"
        self.shared = set()  # marks, and assets with their state, that an answered share has taken along
        self.pushes = {}   # title -> commit id, None while unanswered
        self.counts = dict.fromkeys(("commits", "shares", "pulls", "conflicts", "refused"), 0)
        self.failure = None

    def fresh(self, what):
        self.serial += 1
        return f"{what}-{self.name}-{self.serial}"

    def post(self, href, body, kind="application/json;charset=utf-8", expected=(200, 201, 204)):
        """The document, or None when the hub refused in one of the ways that are right here."""
        status, payload = self.wire.send("POST", href, body, kind, self.fresh("key"), self.random.random() < 0.5)
        if status in (200, 201):
            return json.loads(payload)
        if status not in expected:
            raise Violation(f"POST {href}: {status} {payload[:300]!r}")
        self.counts["refused"] += status >= 400
        return None

    def session(self):
        return self.wire.get(self.session_href)

    def run(self):
        try:
            self.wire.login()
            production = self.wire.get(self.production_href)
            while not self.session_href:
                try:
                    body = json.dumps({"name": self.name, "description": "", "isTemporary": False})
                    self.session_href = link(self.post(link(production, "/sessions"), body), "self")
                except Unanswered:
                    pass
            while time.monotonic() < self.end:
                step = self.random.choices((self.edit, self.push, self.pull, self.resolve, self.roll_back),
                                           (8, 4, 3, 3, 1))[0]
                try:
                    step()
                except Unanswered:
                    pass
        except Exception as error:  # pylint: disable=broad-except
            self.failure = f"{self.name}: {type(error).__name__}: {error}"

    # Steps. What a step may have done is noted before the request, what it has done after the answer.

    def transaction(self):
        session = self.session()
        body = {":commitId": session["zo:commitId"], ":requireHead": True,
                "metadata": {"applicationName": "hub_stress", "transactionType": "edit"}}
        return self.post(link(session, "/transactions"), json.dumps(body), expected=(412,))

    def commit(self, transaction, title):
        body = {":resolveStrategy": self.random.choice(("NONE", "AUTO")), ":commitMessage": title}
        done = self.post(link(transaction, "/transactions/transaction#commit"), json.dumps(body), expected=(412,))
        self.counts["commits"] += done is not None
        return done

    def put(self, asset, properties):
        status, payload = self.wire.send("PUT", link(asset, "edit"), json.dumps(properties),
                                         "application/json;charset=utf-8", self.fresh("key"))
        if status != 200:
            raise Violation(f"PUT {link(asset, 'edit')}: {status} {payload[:300]!r}")

    def edit(self):
        transaction = self.transaction()
        if not transaction:
            return
        works = self.random.choices((self.append, self.create, self.remove), (2, 1, 1), k=self.random.randint(1, 3))
        notes = [note for note in (work(transaction) for work in works) if note]
        for table, item, before, _ in notes:
            table[item] = before
        done = self.commit(transaction, self.fresh("commit"))
        for table, item, _, after in notes:
            if done:
                table[item] = after
            elif table is self.marks or after == "sure":
                table.pop(item)  # refused, so it never was
            else:
                table[item] = "sure"

    def asset(self, line, identifier):
        for asset in self.wire.get(link(line, "/assets"))["assets"]:
            if asset["zo:assetId"] == identifier:
                return asset
        return None

    def append(self, transaction):
        ledger = f"ledger{self.random.randrange(LEDGERS)}"
        mark = self.fresh("m")
        asset = self.asset(transaction, ledger)
        properties = asset["properties"]
        properties["description"] = (properties["description"] + " " + mark).strip()
        self.put(asset, properties)
        return self.marks, mark, [ledger, "open"], [ledger, "sure"]

    def create(self, transaction):
        identifier = self.fresh("own")
        body = {"zo:assetId": identifier,
                "properties": {"name": identifier, "description": "", "cdzo:assetType": "masterclip"}}
        asset = self.post(link(transaction, "/assets/asset#create"), json.dumps(body))
        payload, kind = form(((":name", "payload"), (":enclosure", payload_of(identifier))))
        self.post(link(asset, "/enclosures/enclosure#create"), payload, kind)
        return self.assets, identifier, "open", "sure"

    def remove(self, transaction):
        owned = sorted(item for item, state in self.assets.items() if state == "sure")
        if not owned:
            return None
        identifier = self.random.choice(owned)
        asset = self.asset(transaction, identifier)
        if not asset:
            # One of the other steps of this transaction has removed it.
            return None
        status, payload = self.wire.send("DELETE", link(asset, "delete"), key=self.fresh("key"))
        if status != 204:
            raise Violation(f"DELETE {identifier}: {status} {payload[:300]!r}")
        return self.assets, identifier, "removing", "removed"

    def roll_back(self):
        transaction = self.transaction()
        if transaction:
            self.append(transaction)
            self.post(link(transaction, "/transactions/transaction#rollback"), "{}")

    def push(self):
        session, title = self.session(), self.fresh("share")
        # What is taken along, if it is: only what is certain now.
        taken = {mark for mark, (_, state) in self.marks.items() if state == "sure"}
        taken |= {(item, state) for item, state in self.assets.items() if state in ("sure", "removed")}
        body, kind = form(((":commitMessage", title), (":commitId", session["zo:commitId"]),
                           (":resolveStrategy", self.random.choice(("NONE", "AUTO")))))
        self.pushes[title] = None
        done = self.post(link(session, "/sessions/session#push"), body, kind, expected=(409, 412))
        del self.pushes[title]
        if not done:
            return
        self.shared |= taken
        self.counts["shares"] += 1
        if done["zo:commitId"] != session["zo:commitId"] and done["zo:commitId"] == done["zo:baseCommitId"]:
            newest = self.wire.get(link(done, "/productions/production#history"))["versions"][0]
            if newest["title"] == title:
                self.pushes[title] = done["zo:commitId"]

    def pull(self):
        session = self.session()
        strategy = self.random.choice(("interactive", "interactive", "", "safe", "accept-theirs"))
        body, kind = form(((":mergeStrategy", strategy),))
        self.counts["pulls"] += 1
        with Withdrawal(self, strategy == "accept-theirs"):
            self.post(link(session, "/sessions/session#pull"), body, kind, expected=(409,))

    def resolve(self):
        session = self.session()
        outgoing = self.wire.get(link(session, "/sessions/session#outgoingChanges"))["differences"]
        for entry in outgoing["assets"] + outgoing["enclosures"]:
            if "zo:conflictsWithContentId" not in entry:
                continue
            takes_theirs = self.random.random() < 0.4
            if not takes_theirs and not self.write_both(session, entry["zo:assetId"]):
                return
            session = self.session()
            with Withdrawal(self, takes_theirs):
                done = self.post(link(entry, "accept-theirs" if takes_theirs else "accept-yours"),
                                 json.dumps({":commitId": session["zo:commitId"]}), expected=(404, 412))
            self.counts["conflicts"] += done is not None

    def write_both(self, session, ledger):
        """Their marks and mine; afterwards mine is what both want."""
        there = link(session, "/assets/asset#byId").replace("{commitId}", session["zo:baseCommitId"])
        theirs = self.wire.get(there.replace("{assetId}", ledger))["properties"]["description"].split()
        transaction = self.transaction()
        if not transaction:
            return False
        asset = self.asset(transaction, ledger)
        mine = asset["properties"]["description"].split()
        asset["properties"]["description"] = " ".join(theirs + [mark for mark in mine if mark not in theirs])
        self.put(asset, asset["properties"])
        return self.commit(transaction, self.fresh("both")) is not None


class Withdrawal:
    """Around a step that may take their side: own marks that are gone afterwards were withdrawn."""

    def __init__(self, client, happens):
        self.client, self.happens = client, happens

    def __enter__(self):
        return self

    def __exit__(self, *_):
        if not self.happens:
            return
        present = ledgers(self.client.wire, self.client.session())
        for mark, note in self.client.marks.items():
            if mark in self.client.shared or note[1] == "withdrawn":
                continue
            if mark not in present[note[0]]:
                note[1] = "withdrawn"


def payload_of(identifier):
    return (identifier + "\n") * (PAYLOAD // (len(identifier) + 1))


def assets_of(wire, line):
    return {asset["zo:assetId"]: asset for asset in wire.get(link(line, "/assets#full"))["assets"]}


def ledgers(wire, line):
    return {asset["zo:assetId"]: asset["properties"]["description"].split()
            for asset in wire.get(link(line, "/assets"))["assets"] if asset["zo:assetId"].startswith("ledger")}


class Verifier:
    def __init__(self, wire, production, clients):
        self.wire, self.production, self.clients, self.problems = wire, production, clients, []
        self.shared = assets_of(wire, production)

    def problem(self, text):
        self.problems.append(text)

    def run(self):
        self.check_history()
        known = {mark for client in self.clients for mark in client.marks}
        self.check_marks("the production", self.shared, known)
        for client in self.clients:
            session = assets_of(client.wire, client.session())
            self.check_marks("the session of " + client.name, session, known)
            self.check_client(client, session)
        return self.problems

    def check_history(self):
        found, href = {}, link(self.production, "/productions/production#history")
        while href:
            page = self.wire.get(href)
            for version in page["versions"]:
                found.setdefault(version["title"], []).append(version["commitId"])
            href = next((entry["href"] for entry in page["links"] if entry["rel"] == "next"), None)
        for client in self.clients:
            for title, commit in client.pushes.items():
                commits = found.pop(title, [])
                if commit and commits != [commit]:
                    self.problem(f"{title} was answered with {commit} but the history has {commits}")
                if not commit and len(commits) > 1:
                    self.problem(f"{title} was not answered and is there {len(commits)} times")
        for title, commits in found.items():
            if title.startswith("share-"):
                self.problem(f"{title} is in the history though it was refused, or changed nothing: {commits}")

    def check_marks(self, where, assets, known):
        for item in (f"ledger{number}" for number in range(LEDGERS)):
            marks = assets[item]["properties"]["description"].split() if item in assets else []
            for mark in set(marks):
                if marks.count(mark) != 1 or mark not in known:
                    self.problem(f"{mark} is {marks.count(mark)} times in {item} of {where}")

    def check_client(self, client, session):
        def has(assets, ledger, mark):
            return ledger in assets and mark in assets[ledger]["properties"]["description"].split()

        for mark, (ledger, state) in client.marks.items():
            if state == "sure" and not has(session, ledger, mark):
                self.problem(f"{mark} was answered and is not in the session of {client.name}")
            if mark in client.shared and not has(self.shared, ledger, mark):
                self.problem(f"{mark} was shared and is not in the production")
        for item, state in client.assets.items():
            if state == "sure" and item not in session:
                self.problem(f"{item} was answered and is not in the session of {client.name}")
            if state == "sure" and (item, "sure") in client.shared and item not in self.shared:
                self.problem(f"{item} was shared and is not in the production")
            if state == "removed" and item in session:
                self.problem(f"{item} was removed and is in the session of {client.name} again")
            if (item, "removed") in client.shared and item in self.shared:
                self.problem(f"the removal of {item} was shared and it is in the production again")
            for assets in (session, self.shared):
                if item in assets:
                    self.check_payload(client.wire, assets[item], item)

    def check_payload(self, wire, asset, item):
        enclosures = asset["enclosures"]["enclosures"]
        if len(enclosures) != 1:
            self.problem(f"{item} has {len(enclosures)} enclosures")
            return
        _, payload = wire.send("GET", link(enclosures[0], "/enclosures/enclosure"))
        if payload.decode() != payload_of(item):
            self.problem(f"the payload of {item} is not what was sent")


def prepare(hub, names):
    for name in names:
        added = hub.run("user", "add", name, "--admin", "--password-stdin", input=f"secret-{name}\n")
        if added.returncode != 0:
            raise SystemExit("hub_stress: " + added.stdout + added.stderr)
    hub.start()
    wire = Wire(hub, names[0])
    service = wire.login()
    json_kind = "application/json;charset=utf-8"
    _, payload = wire.send("POST", link(service, "/productions"),
                           json.dumps({"name": "Stress", "description": "", "isTemporary": False}), json_kind)
    production = json.loads(payload)
    for number in range(LEDGERS):
        body = {"zo:assetId": f"ledger{number}",
                "properties": {"name": f"ledger {number}", "description": "", "cdzo:assetType": "bin"}}
        wire.send("POST", link(production, "/assets/asset#create"), json.dumps(body), json_kind)
    return wire, link(production, "self")


def kill_now_and_then(hub, choices, kills, seconds, end):
    moments = sorted(choices.uniform(0.05, 0.95) * seconds for _ in range(kills))
    begin = end - seconds
    for moment in moments:
        time.sleep(max(0.0, begin + moment - time.monotonic()))
        hub.kill()
        hub.start()


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("build_dir", type=pathlib.Path)
    parser.add_argument("--clients", type=int, default=20)
    parser.add_argument("--seconds", type=float, default=60)
    parser.add_argument("--kills", type=int, default=0)
    parser.add_argument("--seed", type=int, default=random.SystemRandom().randrange(1 << 32))
    options = parser.parse_args()
    if not 1 <= options.clients <= 200 or not 0 < options.seconds <= 3600 or not 0 <= options.kills <= 10000:
        parser.error("at most 200 clients, 3600 seconds and 10000 kills")
    binary = options.build_dir.resolve() / "bin/zohub"
    print(f"hub_stress: seed {options.seed}", flush=True)
    with tempfile.TemporaryDirectory(prefix="hub_stress") as directory:
        hub = HubProcess(binary, pathlib.Path(directory))
        try:
            return stress(hub, options)
        finally:
            hub.stop()


def stress(hub, options):
    names = [f"user{number}" for number in range(options.clients)]
    wire, production = prepare(hub, names)
    clients = [Client(hub, name, options.seed, production) for name in names]
    end = time.monotonic() + options.seconds
    for client in clients:
        client.end = end
        client.start()
    kill_now_and_then(hub, random.Random(f"{options.seed}:kills"), options.kills, options.seconds, end)
    for client in clients:
        client.join()
    problems = [client.failure for client in clients if client.failure]
    if not problems:
        problems = Verifier(wire, wire.get(production), clients).run()
    hub.stop()
    check = hub.run("check")
    if check.returncode != 0:
        problems.append("zohub check: " + check.stdout + check.stderr)
    for problem in problems[:50]:
        print("hub_stress: " + problem)
    total = {key: sum(client.counts[key] for client in clients) for key in clients[0].counts}
    print(f"hub_stress: seed {options.seed}, {options.clients} clients, {options.seconds:g} s, {options.kills} kills: "
          f"{sum(client.wire.answered for client in clients)} answers, "
          f"{sum(client.wire.unanswered for client in clients)} unanswered, {total['commits']} commits, "
          f"{total['shares']} shares, {total['pulls']} pulls, {total['conflicts']} conflicts answered, "
          f"{total['refused']} refused: {'all sound' if not problems else str(len(problems)) + ' problems'}")
    return 1 if problems else 0


if __name__ == "__main__":
    sys.exit(main())
